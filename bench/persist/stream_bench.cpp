// Encoding and decoding 10 million values through C3DStreamHelper over a memory stream, in the
// compact and the plain form, beside protobuf's CodedOutputStream/CodedInputStream on the same
// values (varints for the integers, zigzag for the signed ones, fixed 8 bytes for doubles).
#include <random>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>
#include <google/protobuf/io/coded_stream.h>
#include <google/protobuf/io/zero_copy_stream_impl_lite.h>
#include <google/protobuf/wire_format_lite.h>

#include <ut/persist.h>
#include <ut/platform/stream.h>

namespace {

constexpr std::size_t kValues = 10'000'000;

using google::protobuf::internal::WireFormatLite;
using google::protobuf::io::ArrayInputStream;
using google::protobuf::io::CodedInputStream;
using google::protobuf::io::CodedOutputStream;
using google::protobuf::io::StringOutputStream;

// Sizes as scene data has them: mostly small counts, flags and indexes, some ids and offsets,
// a few hashes.
std::vector<ULONG> MakeUnsigned() {
    std::mt19937 random(1);
    std::vector<ULONG> values(kValues);
    for (ULONG& v : values) {
        unsigned pick = random() % 100;
        ULONG bits = static_cast<ULONG>(random());
        v = pick < 50   ? bits % 16
            : pick < 75 ? bits % 4096
            : pick < 90 ? bits % 0x100000
            : pick < 97 ? bits % 0x10000000
                        : bits;
    }
    return values;
}

std::vector<LONG> MakeSigned() {
    std::vector<ULONG> magnitudes = MakeUnsigned();
    std::vector<LONG> values(kValues);
    for (std::size_t i = 0; i < kValues; ++i)
        values[i] = static_cast<LONG>(magnitudes[i] >> 1) * (i % 3 == 0 ? -1 : 1);
    return values;
}

// Transforms and parameters: zeros and ones, small integers, single-precision values, and
// computed doubles.
std::vector<double> MakeDoubles() {
    std::mt19937 random(2);
    std::uniform_real_distribution<double> real(-1000, 1000);
    std::vector<double> values(kValues);
    for (double& v : values) {
        unsigned pick = random() % 100;
        v = pick < 30   ? static_cast<double>(random() % 2)
            : pick < 45 ? static_cast<double>(random() % 500) - 250
            : pick < 70 ? static_cast<float>(real(random))
                        : real(random);
    }
    return values;
}

const std::vector<ULONG>& Unsigned() {
    static const std::vector<ULONG> values = MakeUnsigned();
    return values;
}
const std::vector<LONG>& Signed() {
    static const std::vector<LONG> values = MakeSigned();
    return values;
}
const std::vector<double>& Doubles() {
    static const std::vector<double> values = MakeDoubles();
    return values;
}

struct UnsignedKind {
    static const std::vector<ULONG>& Values() { return Unsigned(); }
    static HRESULT Put(C3DStreamHelper& h, ULONG v) { return h.PutUInt32(v); }
    static HRESULT Get(C3DStreamHelper& h, ULONG& v) { return h.GetUInt32(v); }
    static void Write(CodedOutputStream& out, ULONG v) { out.WriteVarint32(v); }
    static bool Read(CodedInputStream& in, ULONG& v) {
        google::protobuf::uint32 x = 0;
        bool ok = in.ReadVarint32(&x);
        v = x;
        return ok;
    }
};

struct SignedKind {
    static const std::vector<LONG>& Values() { return Signed(); }
    static HRESULT Put(C3DStreamHelper& h, LONG v) { return h.PutInt32(v); }
    static HRESULT Get(C3DStreamHelper& h, LONG& v) { return h.GetInt32(v); }
    static void Write(CodedOutputStream& out, LONG v) {
        out.WriteVarint32(WireFormatLite::ZigZagEncode32(v));
    }
    static bool Read(CodedInputStream& in, LONG& v) {
        google::protobuf::uint32 x = 0;
        bool ok = in.ReadVarint32(&x);
        v = WireFormatLite::ZigZagDecode32(x);
        return ok;
    }
};

struct DoubleKind {
    static const std::vector<double>& Values() { return Doubles(); }
    static HRESULT Put(C3DStreamHelper& h, double v) { return h.PutDouble(v); }
    static HRESULT Get(C3DStreamHelper& h, double& v) { return h.GetDouble(v); }
    static void Write(CodedOutputStream& out, double v) {
        out.WriteLittleEndian64(WireFormatLite::EncodeDouble(v));
    }
    static bool Read(CodedInputStream& in, double& v) {
        google::protobuf::uint64 x = 0;
        bool ok = in.ReadLittleEndian64(&x);
        v = WireFormatLite::DecodeDouble(x);
        return ok;
    }
};

enum class Form { Compact, Plain };

void Rewind(IStream* stream) {
    LARGE_INTEGER start{};
    stream->Seek(start, STREAM_SEEK_SET, nullptr);
}

// Writes every value of the kind to `target` (emptied first) in the form.
template <class Kind>
void Encode(IStream* target, Form form) {
    ULARGE_INTEGER empty{};
    target->SetSize(empty);
    Rewind(target);
    if (form == Form::Plain) {
        C3DStreamHelper helper(target);
        for (auto v : Kind::Values())
            Kind::Put(helper, v);
        return;
    }
    ut::ComPtr<IStream> stream;
    KXOpenPersistStreamForSave(target, nullptr, stream.Put());
    {
        C3DStreamHelper helper(stream.Get());
        for (auto v : Kind::Values())
            Kind::Put(helper, v);
    }
    KXClosePersistStream(stream.Get());
}

ut::ComPtr<IStream> NewStream() {
    ut::ComPtr<IStream> stream;
    ut::platform::CreateMemoryStream(stream.Put());
    return stream;
}

ULONGLONG SizeOf(IStream* stream) {
    STATSTG stat{};
    stream->Stat(&stat, STATFLAG_NONAME);
    return stat.cbSize.QuadPart;
}

template <class Kind>
void HelperEncode(benchmark::State& state, Form form) {
    Kind::Values();
    ut::ComPtr<IStream> target = NewStream();
    Encode<Kind>(target.Get(), form); // the stream has grown to its size before timing starts
    for (auto _ : state)
        Encode<Kind>(target.Get(), form);
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * kValues));
    state.counters["bytes_per_value"] = static_cast<double>(SizeOf(target.Get())) / kValues;
}

template <class Kind>
void HelperDecode(benchmark::State& state, Form form) {
    ut::ComPtr<IStream> source = NewStream();
    Encode<Kind>(source.Get(), form);
    typename std::decay_t<decltype(Kind::Values())>::value_type value{}, sum{};
    for (auto _ : state) {
        Rewind(source.Get());
        ut::ComPtr<IStream> stream;
        if (form == Form::Compact)
            KXOpenPersistStreamForLoad(source.Get(), nullptr, stream.Put());
        C3DStreamHelper helper(form == Form::Compact ? stream.Get() : source.Get());
        for (std::size_t i = 0; i < kValues; ++i) {
            Kind::Get(helper, value);
            sum += value;
        }
    }
    benchmark::DoNotOptimize(sum);
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * kValues));
}

template <class Kind>
std::string ProtobufEncoded() {
    std::string bytes;
    StringOutputStream sink(&bytes);
    CodedOutputStream out(&sink);
    for (auto v : Kind::Values())
        Kind::Write(out, v);
    out.Trim();
    return bytes;
}

template <class Kind>
void ProtobufEncode(benchmark::State& state) {
    Kind::Values();
    std::string bytes = ProtobufEncoded<Kind>(); // grown to its size before timing starts
    for (auto _ : state) {
        bytes.clear();
        StringOutputStream sink(&bytes);
        CodedOutputStream out(&sink);
        for (auto v : Kind::Values())
            Kind::Write(out, v);
        out.Trim();
    }
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * kValues));
    state.counters["bytes_per_value"] = static_cast<double>(bytes.size()) / kValues;
}

template <class Kind>
void ProtobufDecode(benchmark::State& state) {
    std::string bytes = ProtobufEncoded<Kind>();
    typename std::decay_t<decltype(Kind::Values())>::value_type value{}, sum{};
    for (auto _ : state) {
        ArrayInputStream source(bytes.data(), static_cast<int>(bytes.size()));
        CodedInputStream in(&source);
        in.SetTotalBytesLimit(INT_MAX);
        for (std::size_t i = 0; i < kValues; ++i) {
            Kind::Read(in, value);
            sum += value;
        }
    }
    benchmark::DoNotOptimize(sum);
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * kValues));
}

template <class Kind>
void Register(const std::string& kind) {
    auto add = [&](const std::string& name, auto function, auto... form) {
        benchmark::RegisterBenchmark((kind + name).c_str(), function, form...)->Unit(benchmark::kMillisecond);
    };
    add("/encode/compact", HelperEncode<Kind>, Form::Compact);
    add("/encode/plain", HelperEncode<Kind>, Form::Plain);
    add("/encode/protobuf", ProtobufEncode<Kind>);
    add("/decode/compact", HelperDecode<Kind>, Form::Compact);
    add("/decode/plain", HelperDecode<Kind>, Form::Plain);
    add("/decode/protobuf", ProtobufDecode<Kind>);
}

const bool registered = [] {
    Register<UnsignedKind>("uint32");
    Register<SignedKind>("int32");
    Register<DoubleKind>("double");
    return true;
}();

} // namespace
