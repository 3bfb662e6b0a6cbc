// A folder of the test's own under the system's temporary folder, removed with its content after.
#pragma once

#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <string>
#include <string_view>

#include <gtest/gtest.h>

namespace ut::test {

// The whole content of a file, or nothing when it cannot be read.
inline std::string FileContent(const std::filesystem::path& path) {
    std::ifstream in(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
}

class TempFolder {
public:
    TempFolder() : root_(std::filesystem::temp_directory_path() / UniqueName()) {
        std::filesystem::remove_all(root_);
        std::filesystem::create_directories(root_);
    }
    ~TempFolder() {
        std::error_code ignored; // what cannot be removed is the system's to clean
        std::filesystem::remove_all(root_, ignored);
    }
    TempFolder(const TempFolder&) = delete;
    TempFolder& operator=(const TempFolder&) = delete;

    const std::filesystem::path& Root() const { return root_; }
    // The path of `name` inside the folder, or of the folder itself.
    std::wstring Path(std::wstring_view name = {}) const {
        return (name.empty() ? root_ : root_ / name).wstring();
    }
    std::wstring operator/(std::wstring_view name) const { return Path(name); }
    // Writes file `name` with `content` as it is; returns its path.
    std::wstring Write(std::wstring_view name, std::string_view content) const {
        std::ofstream(root_ / name, std::ios::binary).write(content.data(), std::streamsize(content.size()));
        return Path(name);
    }
    std::wstring MakeFolder(std::wstring_view name) const {
        std::filesystem::create_directories(root_ / name);
        return Path(name);
    }

private:
    // Unique across processes too: a run that was killed leaves its folder behind.
    static std::string UniqueName() {
        static std::random_device random;
        const auto* test = ::testing::UnitTest::GetInstance()->current_test_info();
        std::string name = std::string("ut_") + (test ? test->name() : "test") + "_" +
                           std::to_string(random()) + std::to_string(random());
        for (char& c : name)
            if (c == '/')
                c = '_';
        return name;
    }

    std::filesystem::path root_;
};

} // namespace ut::test
