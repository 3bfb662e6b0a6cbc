// ut sources: the sources and clips of a scene description (or of the sample scene), found
// through the library as a plug-in's menus find them.
#include <cstdio>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <ut/host/reference_host.h>
#include <ut/platform/text.h>
#include <ut/sdk/shaders.h>
#include <ut/sources.h>

#include "commands.h"

namespace ut::tool {
namespace {

struct SourcesOptions {
    std::string file;
    bool json = false;
};

using Entries = std::vector<std::pair<unsigned int, CKXString>>;

// The members of `classes`, one list after the other, as the name lists count them.
std::vector<ut::ComPtr<IUnknown>> Members(const std::vector<GUID>& classes, bool clips) {
    std::vector<ut::ComPtr<IUnknown>> members;
    for (const GUID& clsid : classes) {
        ut::ComPtr<I3DList> list;
        ULONG count = 0;
        if (FAILED(clips ? F3DGetClipsList(clsid, list.Put()) : F3DGetSourcesList(clsid, list.Put())) ||
            FAILED(list->GetCount(&count)))
            continue;
        for (ULONG i = 0; i < count; ++i) {
            ut::ComPtr<I3DElemRef> element;
            ut::ComPtr<IUnknown> member;
            if (SUCCEEDED(list->GetItem(i, element.Put())))
                (void)element->GetTarget(IID_IUnknown, member.PutVoid(), 1); // none shows as no detail
            members.push_back(std::move(member));
        }
    }
    return members;
}

// A source's file, or the name of the source a clip uses.
std::string Detail(IUnknown* member) {
    ut::ComPtr<I3DSource> source;
    ut::ComPtr<I3DClip> clip;
    ut::ComPtr<IGWNamedObject> named;
    wchar_t* text = nullptr;
    if (member && SUCCEEDED(member->QueryInterface(IID_I3DSource, source.PutVoid())))
        (void)source->GetPath(&text);
    else if (member && SUCCEEDED(member->QueryInterface(IID_I3DClip, clip.PutVoid())) &&
             clip->GetSource(IID_IGWNamedObject, named.PutVoid()) == S_OK)
        (void)named->GetName(&text);
    CKXString detail;
    detail.Attach_OLE(text);
    return ut::platform::Utf8FromWide(detail.View());
}

nlohmann::ordered_json List(bool clips) {
    Entries entries;
    (void)(clips ? F3DMakeClipList(entries, true) : F3DMakeSourceList(entries, true)); // none: empty
    const std::vector<GUID> classes = clips ? std::vector<GUID>{CLSID_3DImageClip}
                                            : std::vector<GUID>{CLSID_3DImageSource, CLSID_3DListedSource};
    std::vector<ut::ComPtr<IUnknown>> members = Members(classes, clips);
    nlohmann::ordered_json list = nlohmann::ordered_json::array();
    for (const auto& [index, name] : entries)
        list.push_back(
            {{"index", index},
             {"name", ut::platform::Utf8FromWide(name.View())},
             {clips ? "source" : "path", Detail(index < members.size() ? members[index].Get() : nullptr)}});
    return list;
}

void Show(const SourcesOptions& options) {
    ut::host::Settings settings;
    settings.scene = options.file.empty() ? SampleScene() : ReadScene(options.file);
    ut::host::ReferenceHost host(settings);
    if (FAILED(host.Status()))
        Fail(kExitUsage, "the reference host did not start");
    nlohmann::ordered_json shown = {{"sources", List(false)}, {"clips", List(true)}};
    if (options.json) {
        std::printf("%s\n", shown.dump().c_str());
        return;
    }
    // Each list's key, the word of its lines, and the key of its detail.
    const char* const kinds[][3] = {{"sources", "source", "path"}, {"clips", "clip", "source"}};
    for (const auto& [key, word, detail] : kinds)
        for (const auto& entry : shown[key])
            std::printf("%-6s %2u  %s  %s\n", word, entry["index"].get<unsigned>(),
                        entry["name"].get<std::string>().c_str(), entry[detail].get<std::string>().c_str());
}

} // namespace

void AddSourcesCommand(CLI::App& app) {
    CLI::App* sources = app.add_subcommand(
        "sources", "List the sources and clips of a scene description (or of the sample scene) by name.");
    auto options = std::make_shared<SourcesOptions>();
    sources->add_option("file", options->file, "a scene description in JSON");
    sources->add_flag("--json", options->json, "print the lists as one JSON object");
    sources->footer(
        "One line per visible source (with its file) and clip (with its source), ordered by "
        "name; the number is the member's place in its container.\nExample:\n  ut sources "
        "shot.json\n  source  0  plate  C:\\plates\\plate.####.pic\n  clip    0  plate_clip  plate");
    sources->callback([options] { Show(*options); });
}

} // namespace ut::tool
