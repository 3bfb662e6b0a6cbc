// The POSIX registry's store: processes that share it, a writer killed mid-way, stores that cannot
// be written or are not stores at all, where the store lives, the cost of an index walk, the
// fixed case rule, and store transactions.
#include <cerrno>
#include <clocale>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <optional>
#include <spawn.h>
#include <sqlite3.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <ut/platform/native/registry_store.h>
#include <ut/platform/regfile.h>

#include "registry_helpers.h"
#include "support/registry_scratch.h"

extern char** environ;

namespace {

using namespace ut::test;
using ut::UniqueHKey;
namespace fs = std::filesystem;

std::string ReadFile(const fs::path& path) {
    std::ifstream in(path, std::ios::binary);
    return std::string((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}

void WriteFile(const fs::path& path, const std::string& bytes) {
    std::ofstream(path, std::ios::binary) << bytes;
}

// A folder of its own in the temporary folder, removed with what it holds.
class TemporaryFolder {
public:
    TemporaryFolder() {
        std::string pattern = (fs::temp_directory_path() / "ut-registry-XXXXXX").string();
        path_ = mkdtemp(pattern.data()) ? fs::path(pattern) : fs::path();
    }
    ~TemporaryFolder() {
        std::error_code ignored;
        fs::remove_all(path_, ignored);
    }
    const fs::path& Path() const { return path_; }

private:
    fs::path path_;
};

// Sets or clears an environment variable for a scope.
class EnvironmentVariable {
public:
    EnvironmentVariable(const char* name, const char* value) : name_(name) {
        if (const char* old = std::getenv(name))
            old_ = old;
        Set(value);
    }
    ~EnvironmentVariable() { Set(old_ ? old_->c_str() : nullptr); }

private:
    void Set(const char* value) {
        if (value)
            setenv(name_, value, 1);
        else
            unsetenv(name_);
    }

    const char* name_;
    std::optional<std::string> old_;
};

// Makes the process use another store for a scope, closing it on both ends.
class StoreSwitch {
public:
    explicit StoreSwitch(const fs::path& path) : variable_("UT_REGISTRY", path.c_str()) {
        ut::platform::CloseRegistryStore();
    }
    ~StoreSwitch() { ut::platform::CloseRegistryStore(); }

private:
    EnvironmentVariable variable_;
};

// A run of the registry_child program, its standard output read line by line.
class Child {
public:
    explicit Child(std::vector<std::string> arguments, std::optional<std::string> store = std::nullopt) {
        arguments.insert(arguments.begin(), UT_REGISTRY_CHILD);
        std::vector<char*> argv;
        for (std::string& argument : arguments)
            argv.push_back(argument.data());
        argv.push_back(nullptr);
        std::vector<std::string> variables;
        for (char** variable = environ; *variable; ++variable)
            if (!store || std::string_view(*variable).substr(0, 12) != "UT_REGISTRY=")
                variables.emplace_back(*variable);
        if (store)
            variables.push_back("UT_REGISTRY=" + *store);
        std::vector<char*> envp;
        for (std::string& variable : variables)
            envp.push_back(variable.data());
        envp.push_back(nullptr);

        int ends[2];
        if (pipe(ends) != 0)
            return;
        posix_spawn_file_actions_t actions;
        posix_spawn_file_actions_init(&actions);
        posix_spawn_file_actions_adddup2(&actions, ends[1], STDOUT_FILENO);
        posix_spawn_file_actions_addclose(&actions, ends[0]);
        if (posix_spawn(&pid_, argv[0], &actions, nullptr, argv.data(), envp.data()) != 0)
            pid_ = -1;
        posix_spawn_file_actions_destroy(&actions);
        close(ends[1]);
        output_ = fdopen(ends[0], "r");
    }
    ~Child() {
        if (pid_ > 0) {
            Kill();
            (void)Wait(); // the test has failed already when the child is still running here
        }
        if (output_)
            std::fclose(output_);
    }

    // The next line of output, without its end; nothing at the end of the output.
    std::optional<std::string> ReadLine() {
        char line[256];
        if (!output_ || !std::fgets(line, sizeof line, output_))
            return std::nullopt;
        std::string text(line);
        if (!text.empty() && text.back() == '\n')
            text.pop_back();
        return text;
    }
    void Kill() { kill(pid_, SIGKILL); }
    // The exit code, or -1 when the child did not exit by itself.
    int Wait() {
        int status = 0;
        if (pid_ <= 0 || waitpid(pid_, &status, 0) != pid_)
            return -1;
        pid_ = -1;
        return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    }

private:
    pid_t pid_ = -1;
    std::FILE* output_ = nullptr;
};

DWORD SubKeyCount(HKEY key) {
    DWORD count = 0;
    EXPECT_EQ(RegQueryInfoKeyW(key, nullptr, nullptr, nullptr, &count, nullptr, nullptr, nullptr, nullptr,
                               nullptr, nullptr, nullptr),
              ERROR_SUCCESS);
    return count;
}

// Fills `parent\name` with `count` sub-keys, each with a default value and a "Name", in one
// transaction.
void Fill(HKEY parent, const std::wstring& name, int count) {
    ut::platform::RegistryTransaction transaction;
    ASSERT_EQ(transaction.Status(), ERROR_SUCCESS);
    UniqueHKey key = CreateKey(parent, name);
    for (int i = 0; i < count; ++i) {
        UniqueHKey child = CreateKey(key.get(), L"key" + std::to_wstring(100000 + i));
        ASSERT_EQ(SetText(child.get(), nullptr, L"default"), ERROR_SUCCESS);
        ASSERT_EQ(SetText(child.get(), L"Name", L"name " + std::to_wstring(i)), ERROR_SUCCESS);
    }
    ASSERT_EQ(transaction.Commit(), ERROR_SUCCESS);
}

TEST(RegistryStore, TwoProcessesWritingAtOnceBothSucceed) {
    ScratchKey scratch;
    Child first({"write", Narrow(scratch.SubKey()) + "\\first", "1000"});
    Child second({"write", Narrow(scratch.SubKey()) + "\\second", "1000"});
    EXPECT_EQ(first.Wait(), 0);
    EXPECT_EQ(second.Wait(), 0);
    for (const wchar_t* name : {L"first", L"second"}) {
        UniqueHKey key = OpenKey(scratch.Get(), name);
        ASSERT_TRUE(key);
        EXPECT_EQ(SubKeyCount(key.get()), 1000u);
        EXPECT_EQ(QueryValue(OpenKey(key.get(), L"key999").get(), nullptr).data, TextBytes(L"value 999"));
    }
}

TEST(RegistryStore, AKilledWriterLosesNothingThatHadReturned) {
    ScratchKey scratch;
    std::vector<long> returned;
    {
        Child writer({"write", Narrow(scratch.SubKey()), "1000000"});
        while (returned.size() < 40) {
            std::optional<std::string> line = writer.ReadLine();
            ASSERT_TRUE(line);
            returned.push_back(std::stol(*line));
        }
        writer.Kill();
        EXPECT_EQ(writer.Wait(), -1);
        while (std::optional<std::string> line = writer.ReadLine())
            returned.push_back(std::stol(*line));
    }
    for (long i : returned) {
        UniqueHKey key = OpenKey(scratch.Get(), L"key" + std::to_wstring(i));
        ASSERT_TRUE(key) << i;
        EXPECT_EQ(QueryValue(key.get(), nullptr).data, TextBytes(L"value " + std::to_wstring(i)));
    }
}

TEST(RegistryStore, AReadOnlyStoreRefusesWritesAndStaysAsItWas) {
    TemporaryFolder folder;
    fs::path store = folder.Path() / "store.db";
    {
        StoreSwitch use(store);
        UniqueHKey key = CreateKey(HKEY_CURRENT_USER, L"Software\\ut-tests\\read-only");
        ASSERT_EQ(SetText(key.get(), L"v", L"kept"), ERROR_SUCCESS);
    }
    // The folder stays open to everyone so that the reader can keep its shared-memory index there.
    ASSERT_EQ(chmod(folder.Path().c_str(), 01777), 0);
    ASSERT_EQ(chmod(store.c_str(), 0444), 0);
    std::string before = ReadFile(store);
    Child probe({"probe", "Software\\ut-tests\\read-only"}, store.string());
    EXPECT_EQ(probe.ReadLine().value_or("no output"), "read=0 create=5 set=5 delete=5");
    EXPECT_EQ(probe.Wait(), 0);
    EXPECT_EQ(ReadFile(store), before);
}

TEST(RegistryStore, WhatIsNotAStoreIsRefusedOnceAndLeftUntouched) {
    TemporaryFolder folder;
    auto sqlite = [](const fs::path& path, const char* sql) {
        sqlite3* db = nullptr;
        ASSERT_EQ(sqlite3_open(path.c_str(), &db), SQLITE_OK);
        EXPECT_EQ(sqlite3_exec(db, sql, nullptr, nullptr, nullptr), SQLITE_OK);
        sqlite3_close(db);
    };
    auto storeWithKeys = [](const fs::path& path) {
        StoreSwitch use(path);
        UniqueHKey key = CreateKey(HKEY_CURRENT_USER, L"Software\\ut-tests\\victim");
        Fill(key.get(), L"many", 300);
    };
    struct Case {
        const char* label;
        std::function<void(const fs::path&)> make;
    };
    const Case cases[] = {
        {"random bytes",
         [](const fs::path& path) {
             std::string bytes(8192, '\0');
             for (std::size_t i = 0; i < bytes.size(); ++i)
                 bytes[i] = static_cast<char>((i * 2654435761u) >> 13);
             WriteFile(path, bytes);
         }},
        {"a text file",
         [](const fs::path& path) { WriteFile(path, std::string(100, 'x') + "\nnot a store\n"); }},
        {"another program's database",
         [&](const fs::path& path) {
             sqlite(path, "CREATE TABLE songs(title TEXT); INSERT INTO songs VALUES('a')");
         }},
        {"a store of a newer version",
         [&](const fs::path& path) {
             storeWithKeys(path);
             sqlite(path, "PRAGMA user_version = 2");
         }},
        {"a damaged store",
         [&](const fs::path& path) {
             storeWithKeys(path);
             std::string bytes = ReadFile(path);
             for (std::size_t i = 4096; i < bytes.size(); ++i)
                 bytes[i] = 'Z';
             WriteFile(path, bytes);
         }},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.label);
        fs::path path = folder.Path() / (std::string(c.label) + ".db");
        c.make(path);
        std::string before = ReadFile(path);
        {
            StoreSwitch use(path);
            testing::internal::CaptureStderr();
            HKEY key = nullptr;
            LONG read = RegOpenKeyExW(HKEY_CURRENT_USER, L"Software\\ut-tests\\victim\\many\\key100299", 0,
                                      KEY_READ, &key);
            LONG written = RegCreateKeyExW(HKEY_CURRENT_USER, L"Software\\new", 0, nullptr, 0, KEY_ALL_ACCESS,
                                           nullptr, &key, nullptr);
            std::string said = testing::internal::GetCapturedStderr();
            EXPECT_EQ(read, ERROR_BADDB);
            EXPECT_EQ(written, ERROR_BADDB);
            EXPECT_NE(said.find(path.string()), std::string::npos) << said;
            EXPECT_EQ(said.find("ut registry"), said.rfind("ut registry")) << said;
        }
        EXPECT_EQ(ReadFile(path), before);
    }
}

TEST(RegistryStore, LivesWhereTheEnvironmentSaysAndMakesItsFolders) {
    struct Case {
        const char* named;
        const char* data;
        const char* home;
        std::string expected;
    };
    const Case cases[] = {
        {"/stores/r.db", "/data", "/home/u", "/stores/r.db"},
        {"", "/data", "/home/u", "/data/ut/registry.db"},
        {nullptr, "relative/data", "/home/u", "/home/u/.local/share/ut/registry.db"},
        {nullptr, nullptr, "/home/u", "/home/u/.local/share/ut/registry.db"},
        {nullptr, nullptr, nullptr, ""},
    };
    for (const Case& c : cases) {
        EnvironmentVariable named("UT_REGISTRY", c.named), data("XDG_DATA_HOME", c.data),
            home("HOME", c.home);
        EXPECT_EQ(ut::platform::RegistryStorePath(), c.expected);
    }

    TemporaryFolder folder;
    EnvironmentVariable data("XDG_DATA_HOME", folder.Path().c_str());
    EnvironmentVariable unnamed("UT_REGISTRY", nullptr);
    {
        StoreSwitch use(""); // empty: the default place
        ASSERT_TRUE(CreateKey(HKEY_LOCAL_MACHINE, L"Software\\ut-tests\\placed"));
    }
    EXPECT_TRUE(fs::is_regular_file(folder.Path() / "ut" / "registry.db"));
}

TEST(RegistryStore, AnIndexWalkCostsTheSameAtEveryStep) {
    ScratchKey scratch;
    Fill(scratch.Get(), L"hundred", 100);
    Fill(scratch.Get(), L"thousand", 1000);
    // Lists the sub-keys one index at a time, reading each one's value as the registration
    // lookups do, and answers what the store ran per step.
    auto walk = [&](const wchar_t* name, DWORD expected) {
        UniqueHKey key = OpenKey(scratch.Get(), name);
        ut::platform::RegistryStoreCounters before = ut::platform::GetRegistryStoreCounters();
        wchar_t child[64];
        DWORD index = 0;
        for (;; ++index) {
            DWORD length = 64;
            if (RegEnumKeyExW(key.get(), index, child, &length, nullptr, nullptr, nullptr, nullptr) !=
                ERROR_SUCCESS)
                break;
            EXPECT_EQ(QueryValue(OpenKey(key.get(), child).get(), L"Name").result, ERROR_SUCCESS);
        }
        EXPECT_EQ(index, expected);
        ut::platform::RegistryStoreCounters after = ut::platform::GetRegistryStoreCounters();
        return std::pair{static_cast<double>(after.statements - before.statements) / index,
                         static_cast<double>(after.machineSteps - before.machineSteps) / index};
    };
    auto [smallStatements, smallSteps] = walk(L"hundred", 100);
    auto [largeStatements, largeSteps] = walk(L"thousand", 1000);
    EXPECT_LE(largeStatements, smallStatements);
    EXPECT_LE(largeSteps, smallSteps * 1.2);
}

TEST(RegistryStore, ReadsComeFromMemoryUntilAnotherProcessCommits) {
    ScratchKey scratch;
    Fill(scratch.Get(), L"list", 100);
    UniqueHKey list = OpenKey(scratch.Get(), L"list");
    ASSERT_EQ(SubKeyNames(list.get()).size(), 100u);
    auto name = [&](const wchar_t* key) { return QueryValue(OpenKey(list.get(), key).get(), L"Name"); };
    ASSERT_EQ(name(L"key100005").data, TextBytes(L"name 5"));
    std::uint64_t before = ut::platform::GetRegistryStoreCounters().statements;
    EXPECT_EQ(name(L"key100005").data, TextBytes(L"name 5"));
    EXPECT_EQ(name(L"key100042").data, TextBytes(L"name 42")); // read with its run of keys
    EXPECT_EQ(ut::platform::GetRegistryStoreCounters().statements, before);

    TemporaryFolder folder;
    std::string path = Narrow(scratch.FullPath()) + "\\list";
    WriteFile(folder.Path() / "change.reg", "Windows Registry Editor Version 5.00\n\n[" + path +
                                                "\\key100005]\n\"Name\"=\"changed\"\n[-" + path +
                                                "\\key100006]\n[" + path + "\\key100000a]\n");
    Child other({"import", (folder.Path() / "change.reg").string()});
    ASSERT_EQ(other.Wait(), 0);
    EXPECT_EQ(name(L"key100005").data, TextBytes(L"changed"));
    EXPECT_EQ(name(L"key100006").result, ERROR_INVALID_HANDLE); // no key to read from
    std::vector<std::wstring> names = SubKeyNames(list.get());
    ASSERT_EQ(names.size(), 100u);
    EXPECT_EQ(names[1], L"key100000a");
}

TEST(RegistryStore, NamesFoldByOneRuleWhateverTheLocale) {
    ScratchKey scratch;
    // Upper-case order: 'Z' < '_' < 'Ä' < 'É' < 'ß'.
    for (const wchar_t* name : {L"\u00df", L"\u00e9", L"_x", L"\u00c92", L"Z", L"\u00c4"})
        ASSERT_TRUE(CreateKey(scratch.Get(), name));
    EXPECT_EQ(SubKeyNames(scratch.Get()),
              (std::vector<std::wstring>{L"Z", L"_x", L"\u00c4", L"\u00e9", L"\u00c92", L"\u00df"}));
    for (const char* locale : {"C", "C.UTF-8", "POSIX"}) {
        ASSERT_NE(std::setlocale(LC_ALL, locale), nullptr) << locale;
        EXPECT_TRUE(OpenKey(scratch.Get(), L"\u00e4")) << locale;
        EXPECT_TRUE(OpenKey(scratch.Get(), L"\u00c9")) << locale;
    }
    std::setlocale(LC_ALL, "C");
}

TEST(RegistryStore, TransactionsCommitWholeOrRollBackWhole) {
    ScratchKey scratch;
    ASSERT_EQ(ut::platform::BeginRegistryTransaction(), ERROR_SUCCESS);
    EXPECT_EQ(ut::platform::BeginRegistryTransaction(), ERROR_INVALID_FUNCTION);
    ASSERT_TRUE(CreateKey(scratch.Get(), L"undone\\deep"));
    EXPECT_EQ(ut::platform::RollbackRegistryTransaction(), ERROR_SUCCESS);
    EXPECT_FALSE(OpenKey(scratch.Get(), L"undone"));
    EXPECT_EQ(ut::platform::CommitRegistryTransaction(), ERROR_INVALID_FUNCTION);
    EXPECT_EQ(ut::platform::RollbackRegistryTransaction(), ERROR_INVALID_FUNCTION);
    {
        ut::platform::RegistryTransaction transaction;
        ASSERT_TRUE(CreateKey(scratch.Get(), L"kept"));
        // A call that fails inside the transaction undoes only itself.
        EXPECT_EQ(RegDeleteKeyW(scratch.Get(), L"missing"), ERROR_FILE_NOT_FOUND);
        EXPECT_EQ(transaction.Commit(), ERROR_SUCCESS);
    }
    EXPECT_TRUE(OpenKey(scratch.Get(), L"kept"));

    // An import that the store refuses part way leaves nothing of it.
    std::string text = "Windows Registry Editor Version 5.00\n\n[" + Narrow(scratch.FullPath()) +
                       "\\imported]\n\"a\"=\"1\"\n\"" + std::string(16384, 'n') + "\"=\"2\"\n";
    ut::platform::RegFileProblem problem;
    EXPECT_EQ(ut::platform::ImportRegFile(text.data(), text.size(), &problem), ERROR_INVALID_PARAMETER);
    EXPECT_EQ(problem.line, 5u);
    EXPECT_FALSE(OpenKey(scratch.Get(), L"imported"));
}

} // namespace
