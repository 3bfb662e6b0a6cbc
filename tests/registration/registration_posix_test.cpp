// What only the POSIX store lets a test arrange: processes registering at the same time, a writer
// killed in the middle of registering, and a store that cannot be written.
#include "registration/registration_test.h"

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <optional>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <ut/platform/native/registry_store.h>
#include <ut/registration.h>

namespace ut::test {
namespace {

namespace fs = std::filesystem;

// A run of registration_child, its output read line by line after the "pid N" it starts with.
class Child {
public:
    explicit Child(const std::string& arguments)
        : output_(popen(("exec " + std::string(UT_REGISTRATION_CHILD) + " " + arguments).c_str(), "r")) {
        std::string first = ReadLine().value_or("");
        pid_ = first.rfind("pid ", 0) == 0 ? static_cast<pid_t>(std::stol(first.substr(4))) : -1;
    }
    ~Child() {
        if (output_ && pid_ > 0)
            Kill(); // a test that failed first may leave the child running
        (void)Wait();
    }
    Child(const Child&) = delete;
    Child& operator=(const Child&) = delete;

    void Kill() { kill(pid_, SIGKILL); }
    std::optional<std::string> ReadLine() {
        std::string line;
        for (int c; output_ && (c = std::fgetc(output_)) != EOF && c != '\n';)
            line.push_back(static_cast<char>(c));
        return line.empty() ? std::nullopt : std::optional(line);
    }
    // The exit status once the child's output is read to its end, or -1 when the child did not end
    // by itself.
    int Wait() {
        if (!output_)
            return -1;
        while (ReadLine()) {
        }
        int status = pclose(output_);
        output_ = nullptr;
        return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    }

private:
    std::FILE* output_;
    pid_t pid_ = -1;
};

std::wstring OperatorName(long n) {
    return L"Operator " + std::to_wstring(n);
}

TEST_F(RegistrationTest, TwoProcessesRegisteringAtOnceLoseNothing) {
    constexpr long kEach = 1000;
    {
        Child first("register 0 " + std::to_string(kEach));
        Child second("register " + std::to_string(kEach) + " " + std::to_string(kEach));
        EXPECT_EQ(first.Wait(), 0);
        EXPECT_EQ(second.Wait(), 0);
    }
    EXPECT_EQ(Listed(L"Operator").size(), static_cast<std::size_t>(2 * kEach));
    for (long n = 0; n < 2 * kEach; ++n)
        ASSERT_EQ(NameOf(L"Operator", TestGuid(static_cast<ULONG>(n))), OperatorName(n)) << n;
}

TEST_F(RegistrationTest, AKilledWriterLosesNoRegistrationThatHadReturned) {
    std::vector<long> returned;
    {
        Child writer("register 0 1000000");
        while (returned.size() < 40) {
            std::optional<std::string> line = writer.ReadLine();
            ASSERT_TRUE(line);
            returned.push_back(std::stol(*line));
        }
        writer.Kill();
        while (std::optional<std::string> line = writer.ReadLine())
            returned.push_back(std::stol(*line));
        EXPECT_EQ(writer.Wait(), -1);
    }
    for (long n : returned) {
        ASSERT_EQ(NameOf(L"Operator", TestGuid(static_cast<ULONG>(n))), OperatorName(n)) << n;
        ASSERT_EQ(
            TextAt(HKEY_CLASSES_ROOT, L"CLSID\\" + GuidToString(TestGuid(static_cast<ULONG>(n))), nullptr),
            OperatorName(n));
    }
    // The interrupted registration, if any, is there whole or not at all.
    EXPECT_GE(Listed(L"Operator").size(), returned.size());
    EXPECT_LE(Listed(L"Operator").size(), returned.size() + 1);
}

TEST(RegistrationStore, WritesThatAreDeniedGiveOneAndHostFailuresTheirCode) {
    std::string pattern = (fs::temp_directory_path() / "ut-registration-XXXXXX").string();
    ASSERT_TRUE(mkdtemp(pattern.data()));
    const fs::path folder(pattern), store = folder / "store.db";
    const std::string previous = std::getenv("UT_REGISTRY") ? std::getenv("UT_REGISTRY") : "";
    setenv("UT_REGISTRY", store.c_str(), 1);
    platform::CloseRegistryStore();
    ASSERT_EQ(KXRegisterKeyPath(TestGuid(2), L"Operator", L"made while it could be written"), S_OK);
    platform::CloseRegistryStore();
    // The folder stays open to everyone so that the reader can keep its shared-memory index there.
    ASSERT_EQ(chmod(folder.c_str(), 01777), 0);
    ASSERT_EQ(chmod(store.c_str(), 0444), 0);
    {
        Child probe("probe");
        EXPECT_EQ(probe.ReadLine().value_or("no output"),
                  "add=1 translator=1 path=1 remove=1 operator=80070005");
        EXPECT_EQ(probe.Wait(), 0);
    }
    setenv("UT_REGISTRY", previous.c_str(), 1);
    platform::CloseRegistryStore();
    std::error_code ignored;
    fs::remove_all(folder, ignored);
}

} // namespace
} // namespace ut::test
