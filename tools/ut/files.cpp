// ut validate, ut paths and ut bitmap: the file helpers on the reference host.
#include <cstdio>
#include <iterator>
#include <memory>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include <ut/bitmap.h>
#include <ut/host/reference_host.h>
#include <ut/paths.h>
#include <ut/platform/text.h>
#include <ut/validate.h>

#include "commands.h"

namespace ut::tool {
namespace {

struct ValidateArguments {
    std::string file;
    std::string extensions;
    bool exists = false;
    bool writable = false;
    bool compound = false;
};

const char* const kKinds[] = {"project", "user",        "workgroup",        "root",
                              "addons",  "user_addons", "workgroup_addons", "none"};

void Validate(const ValidateArguments& arguments) {
    ut::host::ReferenceHost host;
    std::wstring file = platform::WideFromUtf8(arguments.file);
    std::wstring extensions = platform::WideFromUtf8(arguments.extensions);
    int valid = KXValidateFile(file.c_str(), extensions.c_str(), arguments.exists || arguments.writable,
                               arguments.writable, arguments.compound, false, nullptr);
    if (valid < 0)
        Fail(kExitUsage, arguments.file + ": the path cannot be resolved");
    if (valid != 1)
        Fail(kExitNo, arguments.file + ": not acceptable");
    std::printf("acceptable\n");
}

void Paths(const std::string& kind) {
    ut::host::ReferenceHost host;
    bool any = false;
    for (int type = 0; type < static_cast<int>(std::size(kKinds)); ++type) {
        if (!kind.empty() && kind != kKinds[type] && kind != std::to_string(type))
            continue;
        std::vector<CKXString> paths;
        (void)KXGetInstallPaths(static_cast<tagE3D_INSTALL_PATH_TYPE>(type), paths); // none is an answer
        for (const CKXString& path : paths) {
            any = true;
            std::printf("%s%s%s\n", kind.empty() ? kKinds[type] : "", kind.empty() ? " " : "",
                        platform::Utf8FromWide(static_cast<const wchar_t*>(path)).c_str());
        }
    }
    if (!any)
        Fail(kExitNo, "no install folder" + (kind.empty() ? std::string() : " of the kind " + kind));
}

void Bitmap(const std::string& image, const std::string& size, const std::string& out) {
    int width = 0, height = 0;
    char rest = 0;
    if (std::sscanf(size.c_str(), "%dx%d%c", &width, &height, &rest) != 2 || width <= 0 || height <= 0)
        Fail(kExitUsage, "size must be WIDTHxHEIGHT, both positive: " + size);
    ut::host::ReferenceHost host;
    ComPtr<IGWImageLoader> loader;
    ComPtr<IGWImage> loaded;
    if (FAILED(KXGetImageLoader(loader.Put())) ||
        FAILED(loader->LoadFile(platform::WideFromUtf8(image).c_str(), loaded.Put())))
        Fail(kExitUsage, image + ": not an image the host can read");
    RECT rect{0, 0, width, height};
    platform::UniqueBitmap bitmap;
    HRESULT hr = KXGetGWImageAsHBitmap(loaded.Get(), &rect, bitmap.Put());
    if (SUCCEEDED(hr))
        hr = platform::WriteBitmapFile(bitmap.Get(), platform::WideFromUtf8(out).c_str());
    if (FAILED(hr))
        Fail(kExitUsage, out + ": the bitmap could not be made or written");
    std::printf("%s %dx%d\n", out.c_str(), width, height);
}

} // namespace

void AddFileCommands(CLI::App& app) {
    CLI::App* validate = app.add_subcommand("validate", "Say whether FILE is acceptable to load or save.");
    auto arguments = std::make_shared<ValidateArguments>();
    validate->add_option("FILE", arguments->file, "the file, as a user names it")->required();
    validate->add_option("--ext", arguments->extensions,
                         "the extensions allowed, with their dots: \".scn;.pic\"");
    auto* exists = validate->add_flag("--exists", arguments->exists, "the file must exist");
    validate->add_flag("--writable", arguments->writable, "the file must be writable")->excludes(exists);
    validate->add_flag("--compound", arguments->compound, "the file must be a compound file");
    validate->footer("Exit status 0 for acceptable, 1 for not.\nExample:\n  ut validate scene.scn --ext .scn "
                     "--exists --compound\n  acceptable");
    validate->callback([arguments] { Validate(*arguments); });

    CLI::App* paths = app.add_subcommand("paths", "Print the install folders, or those of one KIND.");
    auto kind = std::make_shared<std::string>();
    std::vector<std::string> accepted(std::begin(kKinds), std::end(kKinds));
    std::string names;
    for (std::size_t type = 0; type < std::size(kKinds); ++type) {
        names += (type ? ", " : "") + std::string(kKinds[type]);
        accepted.push_back(std::to_string(type)); // a kind by its number too
    }
    paths->add_option("KIND", *kind, names)->check(CLI::IsMember(accepted));
    paths->footer(
        "The reference host reads them from its preferences (\"paths.user\", ...) and the environment "
        "(UT_USER_PATH, ...). Exit status 1 when there is none.\nExample:\n  ut paths user\n  /home/me\\ut");
    paths->callback([kind] { Paths(*kind); });

    CLI::App* bitmap =
        app.add_subcommand("bitmap", "Fit IMAGE into a device bitmap of WxH and write it as OUT.bmp.");
    auto files = std::make_shared<std::vector<std::string>>(3);
    bitmap->add_option("IMAGE", (*files)[0], "a BMP image")->required();
    bitmap->add_option("SIZE", (*files)[1], "the bitmap's size, WIDTHxHEIGHT")->required();
    bitmap->add_option("OUT", (*files)[2], "the BMP file to write")->required();
    bitmap->footer("Example:\n  ut bitmap photo.bmp 64x48 thumb.bmp\n  thumb.bmp 64x48");
    bitmap->callback([files] { Bitmap((*files)[0], (*files)[1], (*files)[2]); });
}

} // namespace ut::tool
