// ut storage: the tree of a compound file, and the bytes of one of its streams.
#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <ut/platform/process.h>
#include <ut/platform/storage.h>
#include <ut/platform/text.h>

#include "commands.h"

namespace ut::tool {
namespace {

struct StorageArguments {
    std::string file;
    std::string path;
    bool json = false;
};

std::string HexCode(HRESULT hr) {
    char text[16];
    std::snprintf(text, sizeof text, "0x%08lX", static_cast<unsigned long>(static_cast<std::uint32_t>(hr)));
    return text;
}

ComPtr<IStorage> OpenRoot(const std::string& file) {
    ComPtr<IStorage> root;
    std::wstring name = platform::WideFromUtf8(file);
    HRESULT hr =
        StgOpenStorage(name.c_str(), nullptr, STGM_READ | STGM_SHARE_EXCLUSIVE, nullptr, 0, root.Put());
    if (FAILED(hr))
        Fail(kExitUsage, file + ": not a compound file that can be read (" + HexCode(hr) + ")");
    return root;
}

// The elements of `storage`, each with its own elements below it.
nlohmann::ordered_json Tree(IStorage* storage) {
    nlohmann::ordered_json children = nlohmann::ordered_json::array();
    ComPtr<IEnumSTATSTG> list;
    if (FAILED(storage->EnumElements(0, nullptr, 0, list.Put())))
        return children;
    STATSTG stat{};
    while (list->Next(1, &stat, nullptr) == S_OK) {
        std::unique_ptr<wchar_t, TaskMemDeleter> name(stat.pwcsName);
        nlohmann::ordered_json element = {{"name", platform::Utf8FromWide(name.get())}};
        if (stat.type == STGTY_STORAGE) {
            ComPtr<IStorage> child;
            element["type"] = "storage";
            element["clsid"] = platform::Utf8FromWide(GuidToString(stat.clsid));
            if (SUCCEEDED(storage->OpenStorage(name.get(), nullptr, STGM_READ | STGM_SHARE_EXCLUSIVE, nullptr,
                                               0, child.Put())))
                element["children"] = Tree(child.Get());
        } else {
            element["type"] = "stream";
            element["size"] = stat.cbSize.QuadPart;
        }
        children.push_back(std::move(element));
    }
    return children;
}

void PrintTree(const nlohmann::ordered_json& children, const std::string& parent) {
    for (const auto& element : children) {
        std::string path = parent + "/" + element["name"].get<std::string>();
        if (element["type"] == "storage") {
            std::printf("storage %s %s\n", path.c_str(), element["clsid"].get<std::string>().c_str());
            if (element.contains("children"))
                PrintTree(element["children"], path);
        } else {
            std::printf("stream  %s %llu\n", path.c_str(), element["size"].get<unsigned long long>());
        }
    }
}

void Cat(const StorageArguments& arguments) {
    ComPtr<IStorage> storage = OpenRoot(arguments.file);
    std::wstring path = platform::WideFromUtf8(arguments.path);
    std::vector<std::wstring> parts;
    for (std::size_t start = 0; start <= path.size();) {
        std::size_t end = path.find_first_of(L"/\\", start);
        if (end == std::wstring::npos)
            end = path.size();
        if (end > start)
            parts.push_back(path.substr(start, end - start));
        start = end + 1;
    }
    if (parts.empty())
        Fail(kExitUsage, "name a stream: STORAGE/.../STREAM");
    // Every storage on the way stays open: releasing a parent reverts what was opened below it.
    std::vector<ComPtr<IStorage>> opened;
    opened.push_back(std::move(storage));
    for (std::size_t i = 0; i + 1 < parts.size(); ++i) {
        ComPtr<IStorage> child;
        if (FAILED(opened.back()->OpenStorage(parts[i].c_str(), nullptr, STGM_READ | STGM_SHARE_EXCLUSIVE,
                                              nullptr, 0, child.Put())))
            Fail(kExitNo, arguments.path + ": no such storage");
        opened.push_back(std::move(child));
    }
    ComPtr<IStream> stream;
    if (FAILED(opened.back()->OpenStream(parts.back().c_str(), nullptr, STGM_READ | STGM_SHARE_EXCLUSIVE, 0,
                                         stream.Put())))
        Fail(kExitNo, arguments.path + ": no such stream");
    platform::SetBinaryStandardOutput();
    char buffer[1 << 16];
    ULONG read = 0;
    while (SUCCEEDED(stream->Read(buffer, sizeof buffer, &read)) && read > 0)
        std::fwrite(buffer, 1, read, stdout);
}

} // namespace

void AddStorageCommand(CLI::App& app) {
    CLI::App* storage = app.add_subcommand("storage", "Look inside a compound (structured-storage) file.");
    storage->require_subcommand(1);
    auto arguments = std::make_shared<StorageArguments>();
    CLI::App* ls =
        storage->add_subcommand("ls", "List the storages and streams of FILE, with sizes and class ids.");
    ls->add_option("FILE", arguments->file, "the compound file")->required();
    ls->add_flag("--json", arguments->json, "print the tree as one JSON array");
    ls->footer("One line per element: \"storage PATH CLSID\" or \"stream PATH SIZE\".\nExample:\n"
               "  ut storage ls scene.scn\n  stream  /Contents 100\n  storage /Sub "
               "{00000000-0000-0000-0000-000000000000}");
    ls->callback([arguments] {
        ComPtr<IStorage> root = OpenRoot(arguments->file);
        nlohmann::ordered_json tree = Tree(root.Get());
        if (arguments->json)
            std::printf("%s\n", tree.dump().c_str());
        else
            PrintTree(tree, "");
    });
    CLI::App* cat =
        storage->add_subcommand("cat", "Write the bytes of the stream PATH of FILE to standard output.");
    cat->add_option("FILE", arguments->file, "the compound file")->required();
    cat->add_option("PATH", arguments->path, "the stream, below its storages: Sub/Inner")->required();
    cat->footer("Exit status 1 when there is no such stream.\nExample:\n  ut storage cat scene.scn Sub/Inner "
                "> inner.bin");
    cat->callback([arguments] { Cat(*arguments); });
}

} // namespace ut::tool
