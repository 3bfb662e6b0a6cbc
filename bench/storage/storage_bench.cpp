// Compound files through the platform face on POSIX, beside libgsf used directly and Python's
// olefile on the same files: writing and reading back 1,000 streams of 64 KiB, and opening a
// 100 MB file to read one stream of it. The files are made in a temporary folder at run time.
//
// The face commits crash-safely (a temporary file beside, flushed to the disk, renamed over the
// original); libgsf is measured both as a user would call it plainly and with the same flush
// and rename, so that the layer's own cost can be told from the durability's.
#include <array>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <string>
#include <unistd.h>
#include <vector>

#include <ut/platform/storage.h>
#include <ut/platform/text.h>

#include <benchmark/benchmark.h>
#include <gsf/gsf-infile-msole.h>
#include <gsf/gsf-outfile-msole.h>
#include <gsf/gsf.h>
// After the library's headers, whose names some of its macros would take.
#include <fcntl.h>

namespace {

constexpr int kStreams = 1000;
constexpr std::size_t kStreamSize = 64 * 1024;
constexpr int kBigStreams = 100;
constexpr std::size_t kBigStreamSize = 1 << 20;
constexpr DWORD kElement = STGM_READWRITE | STGM_SHARE_EXCLUSIVE;
constexpr DWORD kRead = STGM_READ | STGM_SHARE_EXCLUSIVE;

struct Unref {
    void operator()(void* object) const noexcept { g_object_unref(object); }
};
template <class T>
using Owned = std::unique_ptr<T, Unref>;

// The benchmark's files, in a folder of their own that goes at exit.
class Workspace {
public:
    Workspace() {
        std::string pattern = (std::filesystem::temp_directory_path() / "ut_bench_storage_XXXXXX").string();
        folder_ = ::mkdtemp(pattern.data());
        payload_.resize(std::max(kStreamSize, kBigStreamSize));
        for (std::size_t i = 0; i < payload_.size(); ++i)
            payload_[i] = static_cast<char>(i * 31 + 7);
    }
    ~Workspace() {
        std::error_code ignored;
        std::filesystem::remove_all(folder_, ignored);
    }
    std::string File(const char* name) const { return (folder_ / name).string(); }
    const char* Payload() const { return payload_.data(); }

private:
    std::filesystem::path folder_;
    std::string payload_;
};

Workspace& Files() {
    static Workspace workspace;
    return workspace;
}

// "s<i>", the name of the benchmark's i-th stream. (Built with snprintf: GCC 12 warns wrongly
// about std::string concatenation at -O3.)
std::string StreamName(int i) {
    char name[16];
    std::snprintf(name, sizeof name, "s%d", i);
    return name;
}

std::wstring Name(int i) {
    return ut::platform::WideFromUtf8(StreamName(i));
}

// --- the face ---------------------------------------------------------------------------------

bool FaceWrite(const std::string& path, int streams, std::size_t size) {
    ut::ComPtr<IStorage> root;
    if (FAILED(StgCreateDocfile(ut::platform::WideFromUtf8(path).c_str(), kElement | STGM_CREATE, 0,
                                root.Put())))
        return false;
    for (int i = 0; i < streams; ++i) {
        ut::ComPtr<IStream> stream;
        if (FAILED(root->CreateStream(Name(i).c_str(), kElement, 0, 0, stream.Put())) ||
            FAILED(stream->Write(Files().Payload(), static_cast<ULONG>(size), nullptr)))
            return false;
    }
    return SUCCEEDED(root->Commit(STGC_DEFAULT));
}

std::size_t FaceReadStream(IStorage* root, const std::wstring& name, std::vector<char>& buffer) {
    ut::ComPtr<IStream> stream;
    if (FAILED(root->OpenStream(name.c_str(), nullptr, kRead, 0, stream.Put())))
        return 0;
    std::size_t total = 0;
    ULONG got = 0;
    while (SUCCEEDED(stream->Read(buffer.data(), static_cast<ULONG>(buffer.size()), &got)) && got > 0)
        total += got;
    return total;
}

std::size_t FaceRead(const std::string& path, int first, int count) {
    ut::ComPtr<IStorage> root;
    if (FAILED(
            StgOpenStorage(ut::platform::WideFromUtf8(path).c_str(), nullptr, kRead, nullptr, 0, root.Put())))
        return 0;
    std::vector<char> buffer(kBigStreamSize);
    std::size_t total = 0;
    for (int i = first; i < first + count; ++i)
        total += FaceReadStream(root.Get(), Name(i), buffer);
    return total;
}

// --- libgsf ----------------------------------------------------------------------------------

// Flushes a folder's entries (a rename in it) to the disk, as the face does after its rename.
void SyncFolder(const std::string& path) {
    std::string folder = std::filesystem::path(path).parent_path().string();
    int fd = ::open(folder.empty() ? "." : folder.c_str(), O_RDONLY | O_DIRECTORY);
    if (fd >= 0) {
        ::fsync(fd);
        ::close(fd);
    }
}

// Writes with libgsf; `durable` adds what the face does for crash safety: a temporary file
// beside, flushed to the disk and renamed over the file, and the rename flushed as well.
bool GsfWrite(const std::string& path, int streams, std::size_t size, bool durable) {
    std::string target = durable ? path + ".XXXXXX" : path;
    std::FILE* file = nullptr;
    if (durable) {
        int fd = ::mkstemp(target.data());
        file = fd >= 0 ? ::fdopen(fd, "w+b") : nullptr;
    }
    GError* error = nullptr;
    Owned<GsfOutput> sink(file ? gsf_output_stdio_new_FILE(target.c_str(), file, TRUE)
                               : gsf_output_stdio_new(target.c_str(), &error));
    if (!sink)
        return false;
    Owned<GsfOutfile> root(gsf_outfile_msole_new(sink.get()));
    for (int i = 0; i < streams; ++i) {
        std::string name = StreamName(i);
        Owned<GsfOutput> child(gsf_outfile_new_child(root.get(), name.c_str(), FALSE));
        gsf_output_write(child.get(), size, reinterpret_cast<const guint8*>(Files().Payload()));
        gsf_output_close(child.get());
    }
    bool closed = gsf_output_close(GSF_OUTPUT(root.get()));
    root.reset();
    // Closing the compound file closes its sink as well, where libgsf does so.
    closed = (gsf_output_is_closed(sink.get()) || gsf_output_close(sink.get())) && closed;
    sink.reset();
    if (file) {
        std::fflush(file);
        ::fdatasync(::fileno(file));
        std::fclose(file);
        closed = closed && ::rename(target.c_str(), path.c_str()) == 0;
        SyncFolder(path);
    }
    return closed;
}

std::size_t GsfRead(const std::string& path, int first, int count) {
    GError* error = nullptr;
    Owned<GsfInput> input(gsf_input_stdio_new(path.c_str(), &error));
    Owned<GsfInfile> root(input ? gsf_infile_msole_new(input.get(), &error) : nullptr);
    if (!root)
        return 0;
    std::vector<guint8> buffer(kBigStreamSize);
    std::size_t total = 0;
    for (int i = first; i < first + count; ++i) {
        std::string name = StreamName(i);
        Owned<GsfInput> child(gsf_infile_child_by_name(root.get(), name.c_str()));
        if (!child)
            continue;
        for (gsf_off_t left = gsf_input_size(child.get()); left > 0;) {
            std::size_t chunk = std::min<gsf_off_t>(left, static_cast<gsf_off_t>(buffer.size()));
            if (!gsf_input_read(child.get(), chunk, buffer.data()))
                break;
            total += chunk;
            left -= static_cast<gsf_off_t>(chunk);
        }
    }
    return total;
}

// --- olefile ----------------------------------------------------------------------------------

// Runs the olefile script beside this file and returns the seconds it measured itself (without
// the interpreter's start), or a negative number when Python or olefile is missing.
double OlefileSeconds(const char* mode, const std::string& file, const std::string& stream = "") {
    for (const char* python : {"/usr/bin/python3", "python3"}) {
        char command[4096];
        std::snprintf(command, sizeof command, "%s %s/olefile_bench.py %s %s %s 2>/dev/null", python,
                      UT_BENCH_SOURCE_DIR, mode, file.c_str(), stream.c_str());
        std::FILE* pipe = ::popen(command, "r");
        if (!pipe)
            continue;
        double seconds = -1;
        if (std::fscanf(pipe, "%lf", &seconds) != 1)
            seconds = -1;
        if (::pclose(pipe) == 0 && seconds >= 0)
            return seconds;
    }
    return -1;
}

// --- the files read by every reader --------------------------------------------------------------

// Written through the face: libgsf's own writer links a storage's elements as one list, which
// olefile cannot follow past its recursion limit.
const std::string& ManyStreamsFile() {
    static const std::string path = [] {
        std::string file = Files().File("many.cfb");
        FaceWrite(file, kStreams, kStreamSize);
        return file;
    }();
    return path;
}

const std::string& BigFile() {
    static const std::string path = [] {
        std::string file = Files().File("big.cfb");
        FaceWrite(file, kBigStreams, kBigStreamSize);
        return file;
    }();
    return path;
}

constexpr std::int64_t kManyBytes = static_cast<std::int64_t>(kStreams) * kStreamSize;

void WriteMany_Face(benchmark::State& state) {
    std::string path = Files().File("face_write.cfb");
    for (auto _ : state)
        if (!FaceWrite(path, kStreams, kStreamSize))
            state.SkipWithError("the face could not write");
    state.SetBytesProcessed(state.iterations() * kManyBytes);
}

void WriteMany_Gsf(benchmark::State& state) {
    std::string path = Files().File("gsf_write.cfb");
    for (auto _ : state)
        if (!GsfWrite(path, kStreams, kStreamSize, state.range(0) != 0))
            state.SkipWithError("libgsf could not write");
    state.SetBytesProcessed(state.iterations() * kManyBytes);
}

void ReadMany_Face(benchmark::State& state) {
    for (auto _ : state)
        if (FaceRead(ManyStreamsFile(), 0, kStreams) != static_cast<std::size_t>(kManyBytes))
            state.SkipWithError("the face read short");
    state.SetBytesProcessed(state.iterations() * kManyBytes);
}

void ReadMany_Gsf(benchmark::State& state) {
    for (auto _ : state)
        if (GsfRead(ManyStreamsFile(), 0, kStreams) != static_cast<std::size_t>(kManyBytes))
            state.SkipWithError("libgsf read short");
    state.SetBytesProcessed(state.iterations() * kManyBytes);
}

void ReadMany_Olefile(benchmark::State& state) {
    for (auto _ : state) {
        double seconds = OlefileSeconds("all", ManyStreamsFile());
        if (seconds < 0) {
            state.SkipWithError("no Python with olefile");
            break;
        }
        state.SetIterationTime(seconds);
    }
    state.SetBytesProcessed(state.iterations() * kManyBytes);
}

void OpenBigReadOne_Face(benchmark::State& state) {
    for (auto _ : state)
        if (FaceRead(BigFile(), kBigStreams / 2, 1) != kBigStreamSize)
            state.SkipWithError("the face read short");
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(kBigStreamSize));
}

void OpenBigReadOne_Gsf(benchmark::State& state) {
    for (auto _ : state)
        if (GsfRead(BigFile(), kBigStreams / 2, 1) != kBigStreamSize)
            state.SkipWithError("libgsf read short");
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(kBigStreamSize));
}

void OpenBigReadOne_Olefile(benchmark::State& state) {
    for (auto _ : state) {
        double seconds = OlefileSeconds("one", BigFile(), StreamName(kBigStreams / 2));
        if (seconds < 0) {
            state.SkipWithError("no Python with olefile");
            break;
        }
        state.SetIterationTime(seconds);
    }
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(kBigStreamSize));
}

} // namespace

BENCHMARK(WriteMany_Face)->Unit(benchmark::kMillisecond);
BENCHMARK(WriteMany_Gsf)->ArgName("durable")->Arg(0)->Arg(1)->Unit(benchmark::kMillisecond);
BENCHMARK(ReadMany_Face)->Unit(benchmark::kMillisecond);
BENCHMARK(ReadMany_Gsf)->Unit(benchmark::kMillisecond);
BENCHMARK(ReadMany_Olefile)->UseManualTime()->Iterations(5)->Unit(benchmark::kMillisecond);
BENCHMARK(OpenBigReadOne_Face)->Unit(benchmark::kMillisecond);
BENCHMARK(OpenBigReadOne_Gsf)->Unit(benchmark::kMillisecond);
BENCHMARK(OpenBigReadOne_Olefile)->UseManualTime()->Iterations(5)->Unit(benchmark::kMillisecond);
