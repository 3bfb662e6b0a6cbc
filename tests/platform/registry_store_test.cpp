// What only the POSIX registry's store has: processes sharing it, its file, its costs, transactions.
#include <clocale>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <functional>
#include <optional>
#include <sqlite3.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <utility>

#include <gtest/gtest.h>

#include <ut/platform/native/registry_store.h>
#include <ut/platform/regfile.h>

#include "registry_helpers.h"
#include "support/registry_scratch.h"
#include "support/temp_folder.h"

namespace {

using namespace ut::test;
using ut::UniqueHKey;
namespace fs = std::filesystem;

void WriteFile(const fs::path& path, const std::string& bytes) {
    std::ofstream(path, std::ios::binary) << bytes;
}

// Sets (or with null, clears) an environment variable for a scope.
struct Variable {
    Variable(const char* name, const char* value) : name(name) {
        if (const char* old = std::getenv(name))
            before = old;
        value ? setenv(name, value, 1) : unsetenv(name);
    }
    ~Variable() { before ? setenv(name, before->c_str(), 1) : unsetenv(name); }
    const char* name;
    std::optional<std::string> before;
};

// Makes the process use another store for a scope, closing the store on both ends.
struct StoreSwitch {
    explicit StoreSwitch(const fs::path& path) : store("UT_REGISTRY", path.c_str()) {
        ut::platform::CloseRegistryStore();
    }
    ~StoreSwitch() { ut::platform::CloseRegistryStore(); }
    Variable store;
};

// Runs registry_child with `arguments`, on `store` when given; its output is read line by line.
struct Child {
    explicit Child(const std::string& arguments, const std::string& store = "")
        : output(popen(("exec env " + (store.empty() ? "" : "UT_REGISTRY='" + store + "' ") +
                        "'" UT_REGISTRY_CHILD "' " + arguments)
                           .c_str(),
                       "r")) {}
    ~Child() {
        if (output)
            Wait();
    }
    std::optional<std::string> Line() {
        char line[256];
        if (!std::fgets(line, sizeof line, output))
            return std::nullopt;
        return std::string(line, std::strcspn(line, "\n"));
    }
    // Reads the rest of the output; the exit code, or -1 when the child did not exit by itself.
    int Wait() {
        while (Line())
            continue;
        int status = pclose(std::exchange(output, nullptr));
        return WIFEXITED(status) && WEXITSTATUS(status) < 128 ? WEXITSTATUS(status) : -1;
    }
    std::FILE* output;
};

// Fills `parent\name` with `count` sub-keys with a default value and a "Name", in one transaction.
void Fill(HKEY parent, const std::wstring& name, int count) {
    ut::platform::RegistryTransaction transaction;
    UniqueHKey key = CreateKey(parent, name);
    for (int i = 0; i < count; ++i) {
        UniqueHKey child = CreateKey(key.get(), L"key" + std::to_wstring(100000 + i));
        ASSERT_EQ(SetText(child.get(), nullptr, L"default"), ERROR_SUCCESS);
        ASSERT_EQ(SetText(child.get(), L"Name", L"name " + std::to_wstring(i)), ERROR_SUCCESS);
    }
    ASSERT_EQ(transaction.Commit(), ERROR_SUCCESS);
}

std::string Quoted(const std::wstring& path) {
    return "'" + Narrow(path) + "'";
}

TEST(RegistryStore, TwoProcessesWritingAtOnceBothSucceed) {
    ScratchKey scratch;
    Child first("write " + Quoted(scratch.SubKey() + L"\\first") + " 1000");
    Child second("write " + Quoted(scratch.SubKey() + L"\\second") + " 1000");
    EXPECT_EQ(first.Wait(), 0);
    EXPECT_EQ(second.Wait(), 0);
    for (const wchar_t* name : {L"first", L"second"}) {
        UniqueHKey key = OpenKey(scratch.Get(), name);
        EXPECT_EQ(SubKeyNames(key.get()).size(), 1000u);
        EXPECT_EQ(QueryValue(OpenKey(key.get(), L"key999").get(), nullptr).data, TextBytes(L"value 999"));
    }
}

TEST(RegistryStore, AKilledWriterLosesNothingThatHadReturned) {
    ScratchKey scratch;
    Child writer("write " + Quoted(scratch.SubKey()) + " 1000000");
    pid_t pid = std::stoi(writer.Line().value_or("0"));
    std::vector<long> returned;
    for (std::optional<std::string> line; returned.size() < 40 && (line = writer.Line());)
        returned.push_back(std::stol(*line));
    ASSERT_GT(pid, 0);
    kill(pid, SIGKILL);
    for (std::optional<std::string> line; (line = writer.Line());)
        returned.push_back(std::stol(*line));
    EXPECT_EQ(writer.Wait(), -1);
    ASSERT_GE(returned.size(), 40u);
    for (long i : returned)
        EXPECT_EQ(QueryValue(OpenKey(scratch.Get(), L"key" + std::to_wstring(i)).get(), nullptr).data,
                  TextBytes(L"value " + std::to_wstring(i)));
}

TEST(RegistryStore, AReadOnlyStoreRefusesWritesAndStaysAsItWas) {
    TempFolder temp;
    fs::path folder = temp.Root(), store = folder / "store.db";
    {
        StoreSwitch use(store);
        ASSERT_EQ(
            SetText(CreateKey(HKEY_CURRENT_USER, L"Software\\ut-tests\\read-only").get(), L"v", L"kept"),
            ERROR_SUCCESS);
    }
    // The folder stays open to everyone, so that the reader can keep its shared index there.
    ASSERT_EQ(chmod(folder.c_str(), 01777) | chmod(store.c_str(), 0444), 0);
    std::string before = FileContent(store);
    Child probe("probe 'Software\\ut-tests\\read-only'", store.string());
    EXPECT_EQ(probe.Line().value_or("no output"), "read=0 create=5 set=5 delete=5");
    EXPECT_EQ(probe.Wait(), 0);
    EXPECT_EQ(FileContent(store), before);
}

TEST(RegistryStore, WhatIsNotAStoreIsRefusedOnceAndLeftUntouched) {
    TempFolder temp;
    auto sql = [](const fs::path& path, const char* statements) {
        sqlite3* db = nullptr;
        sqlite3_open(path.c_str(), &db);
        EXPECT_EQ(sqlite3_exec(db, statements, nullptr, nullptr, nullptr), SQLITE_OK);
        sqlite3_close(db);
    };
    auto store = [](const fs::path& path) {
        StoreSwitch use(path);
        Fill(CreateKey(HKEY_CURRENT_USER, L"Software\\ut-tests").get(), L"victim", 300);
    };
    const std::pair<const char*, std::function<void(const fs::path&)>> cases[] = {
        {"bytes of no format", [](const fs::path& path) { WriteFile(path, std::string(8192, '\xA7')); }},
        {"a text file",
         [](const fs::path& path) { WriteFile(path, std::string(100, 'x') + "\nnot a store\n"); }},
        {"another program's database",
         [&](const fs::path& path) { sql(path, "CREATE TABLE songs(title TEXT)"); }},
        {"a store of a newer version",
         [&](const fs::path& path) {
             store(path);
             sql(path, "PRAGMA user_version = 2");
         }},
        {"a damaged store",
         [&](const fs::path& path) {
             store(path);
             std::string bytes = FileContent(path);
             std::fill(bytes.begin() + 4096, bytes.end(), 'Z');
             WriteFile(path, bytes);
         }},
    };
    for (const auto& [label, make] : cases) {
        SCOPED_TRACE(label);
        fs::path path = temp.Root() / (std::string(label) + ".db");
        make(path);
        std::string before = FileContent(path);
        {
            StoreSwitch use(path);
            testing::internal::CaptureStderr();
            EXPECT_EQ(OpenKey(HKEY_CURRENT_USER, L"Software\\ut-tests\\victim\\key100299"), nullptr);
            HKEY key = nullptr;
            EXPECT_EQ(RegOpenKeyExW(HKEY_CURRENT_USER, L"Software", 0, KEY_READ, &key), ERROR_BADDB);
            EXPECT_EQ(SetText(HKEY_CURRENT_USER, L"v", L"x"), ERROR_BADDB);
            std::string said = testing::internal::GetCapturedStderr();
            EXPECT_NE(said.find(path.string()), std::string::npos) << said;
            EXPECT_EQ(said.find("ut registry"), said.rfind("ut registry")) << said;
        }
        EXPECT_EQ(FileContent(path), before);
    }
}

TEST(RegistryStore, LivesWhereTheEnvironmentSaysAndMakesItsFolders) {
    const std::tuple<const char*, const char*, const char*, std::string> cases[] = {
        {"/stores/r.db", "/data", "/home/u", "/stores/r.db"},
        {"", "/data", "/home/u", "/data/ut/registry.db"},
        {nullptr, "relative/data", "/home/u", "/home/u/.local/share/ut/registry.db"},
        {nullptr, nullptr, "/home/u", "/home/u/.local/share/ut/registry.db"},
        {nullptr, nullptr, nullptr, ""},
    };
    for (const auto& [named, data, home, expected] : cases) {
        Variable a("UT_REGISTRY", named), b("XDG_DATA_HOME", data), c("HOME", home);
        EXPECT_EQ(ut::platform::RegistryStorePath(), expected);
    }
    TempFolder temp;
    Variable data("XDG_DATA_HOME", temp.Root().c_str());
    {
        StoreSwitch use(""); // the default place
        ASSERT_TRUE(CreateKey(HKEY_LOCAL_MACHINE, L"Software\\ut-tests\\placed"));
    }
    EXPECT_TRUE(fs::is_regular_file(temp.Root() / "ut" / "registry.db"));
}

TEST(RegistryStore, ReadsCostTheSameAtEveryStepAndNothingUntilAnotherProcessCommits) {
    ScratchKey scratch;
    Fill(scratch.Get(), L"hundred", 100);
    Fill(scratch.Get(), L"thousand", 1000);
    // Walks the sub-keys reading each one's "Name", as registration lookups do: the store's work per step.
    auto walk = [&](const wchar_t* name) {
        UniqueHKey key = OpenKey(scratch.Get(), name);
        ut::platform::RegistryStoreCounters before = ut::platform::GetRegistryStoreCounters();
        std::vector<std::wstring> names = SubKeyNames(key.get());
        for (const std::wstring& child : names)
            EXPECT_EQ(QueryValue(OpenKey(key.get(), child).get(), L"Name").result, ERROR_SUCCESS);
        ut::platform::RegistryStoreCounters after = ut::platform::GetRegistryStoreCounters();
        return std::pair{static_cast<double>(after.statements - before.statements) / names.size(),
                         static_cast<double>(after.machineSteps - before.machineSteps) / names.size()};
    };
    auto [smallStatements, smallSteps] = walk(L"hundred");
    auto [largeStatements, largeSteps] = walk(L"thousand");
    EXPECT_LE(largeStatements, smallStatements);
    EXPECT_LE(largeSteps, smallSteps * 1.2);

    UniqueHKey list = OpenKey(scratch.Get(), L"hundred");
    auto name = [&](const wchar_t* key) { return QueryValue(OpenKey(list.get(), key).get(), L"Name"); };
    ASSERT_EQ(name(L"key100005").data, TextBytes(L"name 5"));
    std::uint64_t statements = ut::platform::GetRegistryStoreCounters().statements;
    EXPECT_EQ(name(L"key100005").data, TextBytes(L"name 5"));
    EXPECT_EQ(ut::platform::GetRegistryStoreCounters().statements, statements);

    TempFolder temp;
    std::string path = Narrow(scratch.FullPath()) + "\\hundred";
    WriteFile(temp.Root() / "change.reg", "Windows Registry Editor Version 5.00\n\n[" + path +
                                              "\\key100005]\n\"Name\"=\"changed\"\n[-" + path +
                                              "\\key100006]\n[" + path + "\\key100000a]\n");
    ASSERT_EQ(Child("import " + (temp.Root() / "change.reg").string()).Wait(), 0);
    EXPECT_EQ(name(L"key100005").data, TextBytes(L"changed"));
    EXPECT_EQ(name(L"key100006").result, ERROR_INVALID_HANDLE); // no key to read from
    std::vector<std::wstring> names = SubKeyNames(list.get());
    ASSERT_EQ(names.size(), 100u);
    EXPECT_EQ(names[1], L"key100000a");
}

TEST(RegistryStore, NamesFoldByOneRuleWhateverTheLocale) {
    ScratchKey scratch;
    for (const wchar_t* name : {L"\u00df", L"\u00e9", L"_x", L"\u00c92", L"Z", L"\u00c4"})
        ASSERT_TRUE(CreateKey(scratch.Get(), name));
    // By upper case: 'Z' < '_' < 'Ä' < 'É' < 'ß'.
    EXPECT_EQ(SubKeyNames(scratch.Get()),
              (std::vector<std::wstring>{L"Z", L"_x", L"\u00c4", L"\u00e9", L"\u00c92", L"\u00df"}));
    for (const char* locale : {"C", "C.UTF-8", "POSIX"}) {
        ASSERT_NE(std::setlocale(LC_ALL, locale), nullptr) << locale;
        EXPECT_TRUE(OpenKey(scratch.Get(), L"\u00e4") && OpenKey(scratch.Get(), L"\u00c9")) << locale;
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
        EXPECT_EQ(RegDeleteKeyW(scratch.Get(), L"missing"), ERROR_FILE_NOT_FOUND); // undoes only itself
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
