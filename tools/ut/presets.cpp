// ut presets find: where the preset of a class is found, location by location, and which one wins.
#include <cstdio>
#include <memory>
#include <string>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <ut/host/reference_host.h>
#include <ut/platform/text.h>
#include <ut/presets.h>

#include "commands.h"

namespace ut::tool {
namespace {

struct FindOptions {
    std::string clsid, name;
    bool json = false;
};

std::string Utf8(const CKXString& text) {
    return ut::platform::Utf8FromWide(text.View());
}

void Find(const FindOptions& options) {
    GUID clsid = GUID_NULL;
    std::wstring classText = ut::platform::WideFromUtf8(options.clsid);
    if (FAILED(ut::ParseGuid(classText.c_str(), &clsid)))
        Fail(kExitUsage, "CLASS must be a braced GUID: " + options.clsid);
    ut::host::ReferenceHost host;
    if (FAILED(host.Status()))
        Fail(kExitUsage, "the reference host did not start");
    const CKXString name = ut::PresetFileName(ut::platform::WideFromUtf8(options.name).c_str());
    CKXString path;
    std::vector<ut::PresetCandidate> examined;
    HRESULT hr = ut::TracePresetSearch(clsid, name, path, examined);
    if (FAILED(hr) && hr != E_FAIL)
        Fail(kExitUsage, "the install locations could not be listed");
    nlohmann::ordered_json locations = nlohmann::ordered_json::array();
    for (const ut::PresetCandidate& candidate : examined)
        locations.push_back(
            {{"kind", candidate.kind},
             {"location", Utf8(candidate.location)},
             {"found", candidate.found.IsEmpty() ? nullptr : nlohmann::ordered_json(Utf8(candidate.found))},
             {"wins", !candidate.found.IsEmpty() && candidate.found == path}});
    // A "no" prints nothing but its one line.
    if (path.IsEmpty())
        Fail(kExitNo, "no preset " + Utf8(name) + " of that class in the " + std::to_string(examined.size()) +
                          " install locations examined");
    if (options.json) {
        std::printf(
            "%s\n",
            nlohmann::ordered_json{{"name", Utf8(name)}, {"locations", locations}, {"path", Utf8(path)}}
                .dump()
                .c_str());
    } else {
        for (const auto& location : locations)
            std::printf(
                "kind %d  %s  %s\n", location["kind"].get<int>(),
                location["location"].get<std::string>().c_str(),
                location["found"].is_null() ? "-"
                : location["wins"].get<bool>()
                    ? ("found, wins: " + location["found"].get<std::string>()).c_str()
                    : ("found, overridden by a later kind: " + location["found"].get<std::string>()).c_str());
    }
    if (!options.json)
        std::printf("%s\n", Utf8(path).c_str());
}

} // namespace

void AddPresetsCommand(CLI::App& app) {
    CLI::App* presets = app.add_subcommand("presets", "Find preset files over the install locations.");
    presets->require_subcommand(1);
    CLI::App* find =
        presets->add_subcommand("find", "Show where the preset NAME of CLASS is found, and which wins.");
    auto options = std::make_shared<FindOptions>();
    find->add_option("CLASS", options->clsid, "the class, as a braced GUID")->required();
    find->add_option("NAME", options->name, "the preset's name (\".Preset\" added when missing)")->required();
    find->add_flag("--json", options->json, "print the search as one JSON object");
    find->footer(
        "Every install location of kinds 0 to 7 is examined in order; a later kind that holds the preset "
        "overrides an earlier one. The last line is the winner; exit status 1 when none holds it.\n"
        "Example:\n  ut presets find {9E5E0001-0000-0000-0101-010101010101} Spot\n"
        "  kind 1  /home/me\\ut  found, overridden by a later kind: ...\n"
        "  kind 5  /home/me\\ut\\Addons  found, wins: ...");
    find->callback([options] { Find(*options); });
}

} // namespace ut::tool
