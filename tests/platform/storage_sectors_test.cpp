// A large stream's bytes go to the next file's sectors as they are written, gathered in stretches:
// changes must read back across commits and reverts, and a full disk fail only the call it meets.
#include <algorithm>
#include <csignal>
#include <map>
#include <random>
#include <string>
#include <sys/resource.h>
#include <tuple>

#include <gtest/gtest.h>

#include <ut/platform/storage.h>

#include "support/compound.h"
#include "support/temp_folder.h"

namespace {

using namespace ut::test;
using ut::ComPtr;

constexpr DWORD kTransacted = STGM_TRANSACTED | STGM_READWRITE | STGM_SHARE_EXCLUSIVE;

// Where the compound file lives: a file, or a global memory block when `bytes` is set.
struct Home {
    HRESULT Create(ComPtr<IStorage>& root) {
        return bytes ? StgCreateDocfileOnILockBytes(bytes.Get(), kCreateMode | STGM_TRANSACTED, 0, root.Put())
                     : StgCreateDocfile(path.c_str(), kCreateMode | STGM_TRANSACTED, 0, root.Put());
    }
    HRESULT Open(ComPtr<IStorage>& root) {
        return bytes ? StgOpenStorageOnILockBytes(bytes.Get(), nullptr, kTransacted, nullptr, 0, root.Put())
                     : StgOpenStorage(path.c_str(), nullptr, kTransacted, nullptr, 0, root.Put());
    }

    std::wstring path;
    ComPtr<ILockBytes> bytes;
};

std::string Slice(const std::string& bytes, std::size_t at, std::size_t count) {
    return at >= bytes.size() ? std::string() : bytes.substr(at, count);
}

// Random writes, resizes across the mini-stream cutoff, reads, destroys, commits, reverts and
// reopenings, on streams held open across steps or opened for one; reads checked against a model.
class Model {
public:
    Model(Home& home, unsigned seed) : home_(home), random_(seed) {}

    void Run(int steps) {
        // Each action's share of the steps is its number of places here.
        static constexpr void (Model::*kActions[])() = {
            &Model::Write, &Model::Write,   &Model::Write,  &Model::Resize, &Model::Read,
            &Model::Read,  &Model::Destroy, &Model::Commit, &Model::Revert, &Model::Reopen};
        ASSERT_EQ(home_.Create(root_), S_OK);
        for (int step = 0; step < steps && !::testing::Test::HasFailure(); ++step) {
            SCOPED_TRACE(step);
            (this->*kActions[Below(std::size(kActions))])();
        }
        Reopen();
    }

private:
    std::size_t Below(std::size_t n) { return std::uniform_int_distribution<std::size_t>(0, n - 1)(random_); }
    std::wstring Pick() { return L"s" + std::to_wstring(Below(4)); }
    // A few bytes, a few KiB, or more than a gathered stretch.
    std::size_t Length() {
        std::size_t kind = Below(3);
        return kind == 0 ? 1 + Below(16) : kind == 1 ? 100 + Below(6000) : 60000 + Below(10000);
    }

    IStream* Held(const std::wstring& name) {
        ComPtr<IStream>& stream = held_[name];
        if (!stream) {
            HRESULT hr = current_.count(name)
                             ? root_->OpenStream(name.c_str(), nullptr, kElementMode, 0, stream.Put())
                             : root_->CreateStream(name.c_str(), kElementMode, 0, 0, stream.Put());
            EXPECT_EQ(hr, S_OK);
            current_[name];
        }
        return stream.Get();
    }

    // Some streams stay open for the next steps, the others are let go now.
    void MaybeLetGo(const std::wstring& name) {
        if (Below(2))
            held_.erase(name);
    }

    void Write() {
        std::wstring name = Pick();
        IStream* stream = Held(name);
        std::string& model = current_[name];
        std::size_t at = Below(model.size() + 3000);
        std::string data(Length(), '\0');
        for (char& c : data)
            c = static_cast<char>(random_());
        ASSERT_EQ(stream->Seek({.QuadPart = LONGLONG(at)}, STREAM_SEEK_SET, nullptr), S_OK);
        ASSERT_EQ(stream->Write(data.data(), static_cast<ULONG>(data.size()), nullptr), S_OK);
        model.resize(std::max(model.size(), at + data.size()));
        model.replace(at, data.size(), data);
        MaybeLetGo(name);
    }

    void Resize() {
        std::wstring name = Pick();
        IStream* stream = Held(name);
        std::string& model = current_[name];
        const std::size_t sizes[] = {
            0, 4095, 4096, 4097, model.size() / 2, model.size() + 5000, Below(150000)};
        std::size_t size = sizes[Below(std::size(sizes))];
        ASSERT_EQ(stream->SetSize({.QuadPart = size}), S_OK);
        model.resize(size);
        MaybeLetGo(name);
    }

    void Read() {
        std::wstring name = Pick();
        if (!current_.count(name))
            return;
        IStream* stream = Held(name);
        const std::string& model = current_[name];
        std::size_t at = Below(model.size() + 100);
        std::string got(Length(), '\0'), expected = Slice(model, at, got.size());
        ULONG read = 0;
        ASSERT_EQ(stream->Seek({.QuadPart = LONGLONG(at)}, STREAM_SEEK_SET, nullptr), S_OK);
        ASSERT_EQ(stream->Read(got.data(), static_cast<ULONG>(got.size()), &read), S_OK);
        got.resize(read);
        EXPECT_TRUE(got == expected) << read << " bytes of " << expected.size() << " read at " << at;
        MaybeLetGo(name);
    }

    void Destroy() {
        std::wstring name = Pick();
        held_.erase(name);
        HRESULT hr = root_->DestroyElement(name.c_str());
        EXPECT_EQ(hr, current_.erase(name) ? S_OK : STG_E_FILENOTFOUND);
    }

    void Commit() {
        ASSERT_EQ(root_->Commit(STGC_DEFAULT), S_OK);
        committed_ = current_;
    }

    void Revert() {
        held_.clear();
        ASSERT_EQ(root_->Revert(), S_OK);
        current_ = committed_;
    }

    // Commits, lets everything go, opens the file again and reads every stream whole.
    void Reopen() {
        Commit();
        held_.clear();
        ASSERT_EQ(home_.Open(root_), S_OK);
        EXPECT_EQ(ElementsOf(root_.Get()).size(), current_.size());
        for (const auto& [name, bytes] : current_)
            EXPECT_TRUE(ReadStream(root_.Get(), name.c_str()) == bytes) << "stream of " << bytes.size();
    }

    Home& home_;
    std::mt19937 random_;
    ComPtr<IStorage> root_;
    std::map<std::wstring, ComPtr<IStream>> held_;
    std::map<std::wstring, std::string> current_;
    std::map<std::wstring, std::string> committed_;
};

TEST(StorageSectors, RandomChangesReadBackBeforeAndAfterCommits) {
    for (bool inMemory : {false, true})
        for (unsigned seed : {1u, 2u, 3u}) {
            SCOPED_TRACE(testing::Message() << (inMemory ? "memory" : "file") << " seed " << seed);
            TempFolder folder;
            Home home{folder / L"model.cfb", {}};
            if (inMemory) {
                ASSERT_EQ(CreateILockBytesOnHGlobal(nullptr, TRUE, home.bytes.Put()), S_OK);
            }
            Model(home, seed).Run(300);
        }
}

// What a stream held before it shrank must not come back when it grows again.
TEST(StorageSectors, AGrownStreamReadsZerosWhereItHadShrunk) {
    // What the row is, the size shrunk to, and whether it grows by a write (else by SetSize).
    const std::tuple<const char*, ULONGLONG, bool> rows[] = {
        {"within a sector, grown by SetSize", 5000, false},
        {"within a sector, grown by a write past the end", 5000, true},
        {"below the mini-stream cutoff", 1000, false},
        {"to nothing", 0, true},
    };
    for (const auto& [what, shrunk, growByWriting] : rows) {
        SCOPED_TRACE(what);
        TempFolder folder;
        ComPtr<IStorage> root;
        ASSERT_EQ(StgCreateDocfile((folder / L"grow.cfb").c_str(), kCreateMode, 0, root.Put()), S_OK);
        ComPtr<IStream> stream;
        ASSERT_EQ(root->CreateStream(L"s", kElementMode, 0, 0, stream.Put()), S_OK);
        std::string content(100000, 'x');
        ASSERT_EQ(stream->Write(content.data(), static_cast<ULONG>(content.size()), nullptr), S_OK);
        ASSERT_EQ(stream->SetSize({.QuadPart = shrunk}), S_OK);
        content.resize(shrunk);
        content.resize(20000, '\0');
        if (growByWriting) {
            ASSERT_EQ(stream->Seek({.QuadPart = 19999}, STREAM_SEEK_SET, nullptr), S_OK);
            ASSERT_EQ(stream->Write("y", 1, nullptr), S_OK);
            content.back() = 'y';
        } else {
            ASSERT_EQ(stream->SetSize({.QuadPart = content.size()}), S_OK);
        }
        stream.Reset();
        EXPECT_TRUE(ReadStream(root.Get(), L"s") == content);
    }
}

// Files may grow only to `limit` bytes while it stands, as on a disk that is full.
class FullDisk {
public:
    explicit FullDisk(rlim_t limit) {
        previousHandler_ = std::signal(SIGXFSZ, SIG_IGN);
        ::getrlimit(RLIMIT_FSIZE, &previous_);
        rlimit lowered = previous_;
        lowered.rlim_cur = limit;
        ::setrlimit(RLIMIT_FSIZE, &lowered);
    }
    ~FullDisk() {
        ::setrlimit(RLIMIT_FSIZE, &previous_);
        std::signal(SIGXFSZ, previousHandler_);
    }

private:
    rlimit previous_{};
    void (*previousHandler_)(int);
};

// A full disk fails the write or the commit that meets it with STG_E_MEDIUMFULL; the file
// stays as it was, and once there is room again the same storage commits everything.
TEST(StorageSectors, AFullDiskFailsOnlyTheCallItMeets) {
    // What the row is, the size of the pieces the new stream is written in, the limit, and whether
    // a write fails (else the commit).
    const std::tuple<const char*, std::size_t, rlim_t, bool> rows[] = {
        {"a large write goes to the file at once", 1 << 20, 256 * 1024, true},
        {"gathered small writes meet it when they go", 1000, 256 * 1024, true},
        {"the commit's tables meet it", 1 << 20, (2 << 20) + 20000, false},
        {"the commit's copy of an unchanged stream meets it", 100, 4000, false},
    };
    for (const auto& [what, pieceSize, limit, writeFails] : rows) {
        SCOPED_TRACE(what);
        TempFolder folder;
        std::wstring path = folder / L"full.cfb";
        ComPtr<IStorage> root;
        ASSERT_EQ(StgCreateDocfile(path.c_str(), kCreateMode | STGM_TRANSACTED, 0, root.Put()), S_OK);
        ASSERT_EQ(PutStream(root.Get(), L"old", Pattern(5000, 1)), S_OK);
        ASSERT_EQ(root->Commit(STGC_DEFAULT), S_OK);
        std::string before = FileContent(path);

        std::size_t total = pieceSize < 4096 && !writeFails ? 3000 : 2 << 20;
        std::string content = Pattern(total, 2);
        ComPtr<IStream> stream;
        ASSERT_EQ(root->CreateStream(L"new", kElementMode, 0, 0, stream.Put()), S_OK);
        HRESULT failed = S_OK;
        {
            FullDisk disk(limit);
            std::size_t at = 0;
            for (; at < total && SUCCEEDED(failed); at += pieceSize) {
                std::size_t count = std::min(pieceSize, total - at);
                failed = stream->Write(content.data() + at, static_cast<ULONG>(count), nullptr);
            }
            if (SUCCEEDED(failed))
                failed = root->Commit(STGC_DEFAULT);
            else
                content.resize(at - pieceSize); // what the stream holds: the failed write left nothing
        }
        EXPECT_EQ(failed, STG_E_MEDIUMFULL);
        STATSTG stat{};
        ASSERT_EQ(stream->Stat(&stat, STATFLAG_NONAME), S_OK);
        EXPECT_EQ(stat.cbSize.QuadPart, writeFails ? content.size() : total);
        EXPECT_EQ(FileContent(path), before) << "the file changed";
        stream.Reset();
        ASSERT_EQ(root->Commit(STGC_DEFAULT), S_OK);
        root.Reset();
        ASSERT_EQ(StgOpenStorage(path.c_str(), nullptr, kReadMode, nullptr, 0, root.Put()), S_OK);
        EXPECT_TRUE(ReadStream(root.Get(), L"new") == content);
        EXPECT_EQ(ReadStream(root.Get(), L"old"), Pattern(5000, 1));
    }
}

} // namespace
