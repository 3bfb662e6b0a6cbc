// Reads arbitrary bytes as a scene description file's header. Nothing may crash or read outside
// the file, and what comes back must be what the token rules can give: S_OK or E_FAIL, and names
// that hold no double quote and fit a line.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <random>
#include <string>
#include <string_view>

#include <ut/mifile.h>
#include <ut/platform/com.h>

namespace {

// One file per process, rewritten for every input.
const std::string& InputPath() {
    static const std::string path = (std::filesystem::temp_directory_path() /
                                     ("ut_mifile_fuzz_" + std::to_string(std::random_device{}()) + ".mi"))
                                        .string();
    return path;
}

// A keyword written twice leaks its first copy by design; ask for names only when that cannot
// happen, so that the leak checker watches every other path.
bool AtMostOnce(std::string_view text, std::string_view keyword) {
    std::size_t first = text.find(keyword);
    return first == std::string_view::npos || text.find(keyword, first + 1) == std::string_view::npos;
}

void CheckName(const char* name) {
    if (!name)
        return;
    if (std::strchr(name, '"') || std::strlen(name) >= 500)
        std::abort();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::string_view text(reinterpret_cast<const char*>(data), size);
    {
        std::ofstream file(InputPath(), std::ios::binary | std::ios::trunc);
        file.write(text.data(), static_cast<std::streamsize>(text.size()));
    }
    std::string name = InputPath();
    long begin = 0, end = 0, step = 0, field = 0;
    char* sceneName = nullptr;
    char* translator = nullptr;
    long result = KXReadMIFileHeader(name.data(), &begin, &end, &step, &field,
                                     AtMostOnce(text, "scene_name") ? &sceneName : nullptr,
                                     AtMostOnce(text, "translator") ? &translator : nullptr);
    if (result != S_OK && result != E_FAIL)
        std::abort();
    if (result == E_FAIL && (begin != 1 || end != 1 || step != 1 || field != 0 || sceneName || translator))
        std::abort(); // a missing block writes nothing beyond the defaults
    CheckName(sceneName);
    CheckName(translator);
    std::free(sceneName);
    std::free(translator);
    return 0;
}
