// Whole scenes saved and loaded through C3DStreamHelper, compact and plain, onto memory and file
// streams, beside the same content as protobuf messages (one message per top-level object,
// children nested) in memory and in a file, in the same binary and run.
#include <algorithm>
#include <cmath>
#include <cstring>
#include <filesystem>
#include <random>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <google/protobuf/io/coded_stream.h>
#include <google/protobuf/io/zero_copy_stream_impl.h>
#include <google/protobuf/io/zero_copy_stream_impl_lite.h>
#include <unistd.h>

#include <ut/persist.h>
#include <ut/platform/stream.h>
#include <ut/platform/text.h>

#include "scene.pb.h"

namespace {

// One object of a scene: what a typical persisted node carries.
struct Object {
    std::wstring name;
    GUID guid{};
    double transform[16]{};
    std::vector<LONG> integers;       // counts, indexes, enum values
    std::vector<ULONG> smallIntegers; // flags and small counts
    std::vector<double> floatExact;   // values that came from single-precision sources
    std::vector<double> doubles;      // computed values
    std::vector<Object> children;
};

struct Scene {
    std::vector<Object> roots;
    std::size_t objects = 0;
};

constexpr int kMaxDepth = 6;

class Generator {
public:
    explicit Generator(std::size_t objects) : remaining_(objects) {}

    Scene Make() {
        Scene scene;
        while (remaining_ > 0)
            scene.roots.push_back(MakeObject(1));
        scene.objects = made_;
        return scene;
    }

private:
    Object MakeObject(int depth) {
        --remaining_;
        ++made_;
        Object o;
        o.name = L"object_" + std::to_wstring(made_) + (made_ % 3 ? L"_mesh" : L"_light");
        o.guid = {static_cast<ULONG>(random_()),
                  static_cast<USHORT>(random_()),
                  static_cast<USHORT>(random_()),
                  {1, 2, 3, 4, 5, 6, 7, static_cast<BYTE>(made_)}};
        for (int i = 0; i < 16; ++i)
            o.transform[i] = i % 5 == 0 ? 1.0 : 0.0;
        if (Pick() < 40) { // translated, sometimes rotated and scaled
            o.transform[12] = Real();
            o.transform[13] = Real();
            o.transform[14] = Real();
        }
        if (Pick() < 15) {
            o.transform[0] = o.transform[5] = std::cos(Real());
            o.transform[1] = std::sin(Real());
            o.transform[4] = -o.transform[1];
        }
        for (unsigned i = 0, n = random_() % 8; i < n; ++i)
            o.integers.push_back(static_cast<LONG>(random_() % 100000) - 50000);
        for (unsigned i = 0, n = random_() % 8; i < n; ++i)
            o.smallIntegers.push_back(random_() % 16);
        for (unsigned i = 0, n = random_() % 6; i < n; ++i)
            o.floatExact.push_back(static_cast<float>(Real()));
        for (unsigned i = 0, n = random_() % 6; i < n; ++i)
            o.doubles.push_back(Real() / 3.0);
        for (unsigned i = 0, n = depth < kMaxDepth ? random_() % 4 : 0; i < n && remaining_ > 0; ++i)
            o.children.push_back(MakeObject(depth + 1));
        return o;
    }

    unsigned Pick() { return random_() % 100; }
    double Real() { return std::uniform_real_distribution<double>(-100, 100)(random_); }

    std::mt19937 random_{7};
    std::size_t remaining_;
    std::size_t made_ = 0;
};

const Scene& SceneOf(std::size_t objects) {
    static Scene small = Generator(10'000).Make();
    static Scene large = Generator(100'000).Make();
    return objects == 10'000 ? small : large;
}

// The chunked stream.

enum : ULONG { kObject = 0x204A424F, kIntegers = 0x49524150, kDoubles = 0x44524150 };

void Save(C3DStreamHelper& h, const Object& o) {
    h.ChunkWriteOpen(kObject, 1);
    h.PutString(CKXString(o.name.c_str()));
    h.PutGUID(o.guid);
    for (double v : o.transform)
        h.PutDouble(v);
    h.ChunkWriteOpen(kIntegers, 1);
    h.PutUInt32(static_cast<ULONG>(o.integers.size()));
    for (LONG v : o.integers)
        h.PutInt32(v);
    h.PutUInt32(static_cast<ULONG>(o.smallIntegers.size()));
    for (ULONG v : o.smallIntegers)
        h.PutUInt32(v);
    h.ChunkWriteClose();
    h.ChunkWriteOpen(kDoubles, 1);
    h.PutUInt32(static_cast<ULONG>(o.floatExact.size()));
    for (double v : o.floatExact)
        h.PutDouble(v);
    h.PutUInt32(static_cast<ULONG>(o.doubles.size()));
    for (double v : o.doubles)
        h.PutDouble(v);
    h.ChunkWriteClose();
    h.PutUInt32(static_cast<ULONG>(o.children.size()));
    for (const Object& child : o.children)
        Save(h, child);
    h.ChunkWriteClose();
}

template <class T>
void LoadValues(C3DStreamHelper& h, std::vector<T>& values) {
    ULONG count = 0;
    h.GetUInt32(count);
    values.resize(count);
    for (T& v : values) {
        if constexpr (std::is_same_v<T, LONG>)
            h.GetInt32(v);
        else if constexpr (std::is_same_v<T, ULONG>)
            h.GetUInt32(v);
        else
            h.GetDouble(v);
    }
}

void Load(C3DStreamHelper& h, Object& o) {
    h.ChunkReadOpen(kObject, nullptr);
    CKXString name;
    h.GetString(name);
    o.name.assign(static_cast<const wchar_t*>(name));
    h.GetGUID(o.guid);
    for (double& v : o.transform)
        h.GetDouble(v);
    h.ChunkReadOpen(kIntegers, nullptr);
    LoadValues(h, o.integers);
    LoadValues(h, o.smallIntegers);
    h.ChunkReadClose();
    h.ChunkReadOpen(kDoubles, nullptr);
    LoadValues(h, o.floatExact);
    LoadValues(h, o.doubles);
    h.ChunkReadClose();
    ULONG children = 0;
    h.GetUInt32(children);
    o.children.resize(children);
    for (Object& child : o.children)
        Load(h, child);
    h.ChunkReadClose();
}

enum class Form { Compact, Plain };
enum class Medium { Memory, File };

std::filesystem::path TempFile(const char* name) {
    return std::filesystem::temp_directory_path() / name;
}

ut::ComPtr<IStream> NewTarget(Medium medium) {
    ut::ComPtr<IStream> stream;
    if (medium == Medium::Memory)
        ut::platform::CreateMemoryStream(stream.Put());
    else
        ut::platform::OpenFileStream(
            ut::platform::WideFromUtf8(TempFile("ut_scene_bench.bin").string()).c_str(),
            STGM_CREATE | STGM_READWRITE, stream.Put());
    return stream;
}

void SeekStart(IStream* stream) {
    LARGE_INTEGER zero{};
    stream->Seek(zero, STREAM_SEEK_SET, nullptr);
}

ULONGLONG SaveScene(const Scene& scene, IStream* target, Form form) {
    SeekStart(target);
    ULARGE_INTEGER empty{};
    target->SetSize(empty);
    if (form == Form::Plain) {
        C3DStreamHelper h(target);
        for (const Object& o : scene.roots)
            Save(h, o);
        h.Flush();
    } else {
        ut::ComPtr<IStream> stream;
        KXOpenPersistStreamForSave(target, nullptr, stream.Put());
        {
            C3DStreamHelper h(stream.Get());
            for (const Object& o : scene.roots)
                Save(h, o);
        }
        KXClosePersistStream(stream.Get());
    }
    STATSTG stat{};
    target->Stat(&stat, STATFLAG_NONAME);
    return stat.cbSize.QuadPart;
}

std::size_t LoadScene(std::size_t roots, IStream* source, Form form, std::vector<Object>& into) {
    SeekStart(source);
    into.resize(roots);
    ut::ComPtr<IStream> stream(source);
    if (form == Form::Compact)
        KXOpenPersistStreamForLoad(source, nullptr, stream.Put());
    C3DStreamHelper h(stream.Get());
    for (Object& o : into)
        Load(h, o);
    return into.size();
}

void Report(benchmark::State& state, const Scene& scene, ULONGLONG bytes) {
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * scene.objects));
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * bytes));
    state.counters["bytes"] = static_cast<double>(bytes);
}

void StreamSave(benchmark::State& state, Form form, Medium medium) {
    const Scene& scene = SceneOf(static_cast<std::size_t>(state.range(0)));
    ut::ComPtr<IStream> target = NewTarget(medium);
    ULONGLONG bytes = 0;
    for (auto _ : state)
        bytes = SaveScene(scene, target.Get(), form);
    Report(state, scene, bytes);
}

void StreamLoad(benchmark::State& state, Form form, Medium medium) {
    const Scene& scene = SceneOf(static_cast<std::size_t>(state.range(0)));
    ut::ComPtr<IStream> source = NewTarget(medium);
    ULONGLONG bytes = SaveScene(scene, source.Get(), form);
    std::vector<Object> loaded;
    for (auto _ : state)
        benchmark::DoNotOptimize(LoadScene(scene.roots.size(), source.Get(), form, loaded));
    if (loaded.back().name != scene.roots.back().name)
        state.SkipWithError("the scene did not read back");
    Report(state, scene, bytes);
}

// Protobuf.

void Fill(ut::bench::SceneObject& m, const Object& o) {
    m.set_name(ut::platform::Utf8FromWide(o.name));
    m.set_guid(&o.guid, sizeof o.guid);
    m.mutable_transform()->Add(std::begin(o.transform), std::end(o.transform));
    m.mutable_integers()->Add(o.integers.begin(), o.integers.end());
    m.mutable_small_integers()->Add(o.smallIntegers.begin(), o.smallIntegers.end());
    m.mutable_float_exact()->Add(o.floatExact.begin(), o.floatExact.end());
    m.mutable_doubles()->Add(o.doubles.begin(), o.doubles.end());
    for (const Object& child : o.children)
        Fill(*m.add_children(), child);
}

// Messages are built from the scene inside the timed loop, as a saver would build them from
// its objects.
std::size_t ProtobufSave(const Scene& scene, google::protobuf::io::ZeroCopyOutputStream& sink) {
    google::protobuf::io::CodedOutputStream out(&sink);
    ut::bench::SceneObject message;
    for (const Object& o : scene.roots) {
        message.Clear();
        Fill(message, o);
        out.WriteVarint32(static_cast<std::uint32_t>(message.ByteSizeLong()));
        message.SerializeToCodedStream(&out);
    }
    out.Trim();
    return static_cast<std::size_t>(out.ByteCount());
}

void Extract(const ut::bench::SceneObject& m, Object& o) {
    o.name = ut::platform::WideFromUtf8(m.name());
    std::memcpy(&o.guid, m.guid().data(), std::min(sizeof o.guid, m.guid().size()));
    std::copy_n(m.transform().begin(), std::min(16, m.transform_size()), o.transform);
    o.integers.assign(m.integers().begin(), m.integers().end());
    o.smallIntegers.assign(m.small_integers().begin(), m.small_integers().end());
    o.floatExact.assign(m.float_exact().begin(), m.float_exact().end());
    o.doubles.assign(m.doubles().begin(), m.doubles().end());
    o.children.resize(static_cast<std::size_t>(m.children_size()));
    for (int i = 0; i < m.children_size(); ++i)
        Extract(m.children(i), o.children[static_cast<std::size_t>(i)]);
}

std::size_t ProtobufLoad(google::protobuf::io::ZeroCopyInputStream& source, std::size_t roots,
                         std::vector<Object>& into) {
    google::protobuf::io::CodedInputStream in(&source);
    in.SetTotalBytesLimit(INT_MAX);
    into.resize(roots);
    ut::bench::SceneObject message;
    for (Object& o : into) {
        std::uint32_t length = 0;
        in.ReadVarint32(&length);
        auto limit = in.PushLimit(static_cast<int>(length));
        message.ParseFromCodedStream(&in);
        in.PopLimit(limit);
        Extract(message, o);
    }
    return into.size();
}

// Where protobuf's messages go: a string, or a file written and read through its descriptor.
class ProtobufTarget {
public:
    explicit ProtobufTarget(Medium medium) : medium_(medium) {
        if (medium == Medium::File)
            file_ = open(TempFile("ut_scene_bench.pb").c_str(), O_RDWR | O_CREAT | O_TRUNC, 0600);
    }
    ~ProtobufTarget() {
        if (file_ >= 0)
            close(file_);
    }
    ProtobufTarget(const ProtobufTarget&) = delete;
    ProtobufTarget& operator=(const ProtobufTarget&) = delete;

    std::size_t Save(const Scene& scene) {
        if (medium_ == Medium::Memory) {
            bytes_.clear();
            google::protobuf::io::StringOutputStream sink(&bytes_);
            return ProtobufSave(scene, sink);
        }
        Rewind();
        if (ftruncate(file_, 0) != 0)
            return 0;
        google::protobuf::io::FileOutputStream sink(file_);
        std::size_t size = ProtobufSave(scene, sink);
        return sink.Flush() ? size : 0;
    }

    std::size_t Load(std::size_t roots, std::vector<Object>& into) {
        if (medium_ == Medium::Memory) {
            google::protobuf::io::ArrayInputStream source(bytes_.data(), static_cast<int>(bytes_.size()));
            return ProtobufLoad(source, roots, into);
        }
        Rewind();
        google::protobuf::io::FileInputStream source(file_);
        return ProtobufLoad(source, roots, into);
    }

private:
    void Rewind() { lseek(file_, 0, SEEK_SET); }

    Medium medium_;
    std::string bytes_;
    int file_ = -1;
};

void ProtobufSaveBench(benchmark::State& state, Medium medium) {
    const Scene& scene = SceneOf(static_cast<std::size_t>(state.range(0)));
    ProtobufTarget target(medium);
    std::size_t bytes = 0;
    for (auto _ : state)
        bytes = target.Save(scene);
    if (bytes == 0)
        state.SkipWithError("the scene was not saved");
    Report(state, scene, bytes);
}

void ProtobufLoadBench(benchmark::State& state, Medium medium) {
    const Scene& scene = SceneOf(static_cast<std::size_t>(state.range(0)));
    ProtobufTarget source(medium);
    std::size_t bytes = source.Save(scene);
    std::vector<Object> loaded;
    for (auto _ : state)
        benchmark::DoNotOptimize(source.Load(scene.roots.size(), loaded));
    if (loaded.back().name != scene.roots.back().name)
        state.SkipWithError("the scene did not read back");
    Report(state, scene, bytes);
}

const bool registered = [] {
    auto add = [](const char* name, auto function, auto... arguments) {
        benchmark::RegisterBenchmark(name, function, arguments...)
            ->Arg(10'000)
            ->Arg(100'000)
            ->Unit(benchmark::kMillisecond);
    };
    add("scene/save/compact/memory", StreamSave, Form::Compact, Medium::Memory);
    add("scene/save/plain/memory", StreamSave, Form::Plain, Medium::Memory);
    add("scene/save/compact/file", StreamSave, Form::Compact, Medium::File);
    add("scene/save/plain/file", StreamSave, Form::Plain, Medium::File);
    add("scene/save/protobuf/memory", ProtobufSaveBench, Medium::Memory);
    add("scene/save/protobuf/file", ProtobufSaveBench, Medium::File);
    add("scene/load/compact/memory", StreamLoad, Form::Compact, Medium::Memory);
    add("scene/load/plain/memory", StreamLoad, Form::Plain, Medium::Memory);
    add("scene/load/compact/file", StreamLoad, Form::Compact, Medium::File);
    add("scene/load/plain/file", StreamLoad, Form::Plain, Medium::File);
    add("scene/load/protobuf/memory", ProtobufLoadBench, Medium::Memory);
    add("scene/load/protobuf/file", ProtobufLoadBench, Medium::File);
    return true;
}();

} // namespace
