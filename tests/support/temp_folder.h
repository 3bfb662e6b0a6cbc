// A folder of its own under the system's temporary folder, removed with everything in it when the
// test is done.
#pragma once

#include <filesystem>
#include <fstream>
#include <string>
#include <string_view>

#include <gtest/gtest.h>

namespace ut::test {

class TempFolder {
public:
    TempFolder() {
        const ::testing::TestInfo* test = ::testing::UnitTest::GetInstance()->current_test_info();
        root_ = std::filesystem::temp_directory_path() /
                (std::string("ut_") + (test ? test->name() : "test") + "_" + std::to_string(Counter()++));
        std::filesystem::remove_all(root_);
        std::filesystem::create_directories(root_);
    }
    ~TempFolder() {
        std::error_code ignored; // a folder that cannot be removed is the system's to clean
        std::filesystem::remove_all(root_, ignored);
    }
    TempFolder(const TempFolder&) = delete;
    TempFolder& operator=(const TempFolder&) = delete;

    // The wide path of `name` inside the folder (the folder itself for an empty name).
    std::wstring Path(std::wstring_view name = {}) const {
        return name.empty() ? root_.wstring() : (root_ / name).wstring();
    }
    // Writes `content` as it is into file `name`; returns its path.
    std::wstring Write(std::wstring_view name, std::string_view content) const {
        std::ofstream file(root_ / name, std::ios::binary);
        file.write(content.data(), static_cast<std::streamsize>(content.size()));
        EXPECT_TRUE(file.good());
        return Path(name);
    }
    std::wstring MakeFolder(std::wstring_view name) const {
        std::filesystem::create_directories(root_ / name);
        return Path(name);
    }

private:
    static int& Counter() {
        static int counter = 0;
        return counter;
    }

    std::filesystem::path root_;
};

} // namespace ut::test
