// Frame-number padding: expanding '#' runs in file-name patterns into frame numbers, and removing them.
#include <cstddef>
#include <cwchar>

#include <ut/detail/names.h>
#include <ut/frames.h>

namespace ut {
namespace {

constexpr wchar_t kPadding = L'#';
// Characters of a working copy before its terminator.
constexpr std::size_t kLongest = static_cast<std::size_t>(kPathCapacity) - 1;

// A bounded writer into a buffer of kPathCapacity characters; what does not fit is dropped.
class Writer {
public:
    explicit Writer(wchar_t* out) : out_(out) {}

    void Put(wchar_t c) {
        if (length_ < kLongest)
            out_[length_++] = c;
    }
    void Put(const wchar_t* text, std::size_t count) {
        for (std::size_t i = 0; i < count; ++i)
            Put(text[i]);
    }
    // The number as "%0*ld" writes it: zeros between the sign and the digits up to `width`.
    void PutNumber(long value, std::size_t width) {
        wchar_t digits[32];
        std::size_t count = 0;
        unsigned long magnitude =
            value < 0 ? 0ul - static_cast<unsigned long>(value) : static_cast<unsigned long>(value);
        do {
            digits[count++] = static_cast<wchar_t>(L'0' + magnitude % 10);
            magnitude /= 10;
        } while (magnitude);
        std::size_t used = count + (value < 0 ? 1 : 0);
        if (value < 0)
            Put(L'-');
        for (; used < width; ++used)
            Put(L'0');
        while (count)
            Put(digits[--count]);
    }
    std::size_t Length() const { return length_; }
    void Terminate() { out_[length_] = L'\0'; }

private:
    wchar_t* out_;
    std::size_t length_ = 0;
};

// Copies at most kLongest characters of `pattern` into `copy` and terminates it.
void CopyBounded(const wchar_t* pattern, wchar_t* copy) {
    Writer writer(copy);
    for (; *pattern; ++pattern)
        writer.Put(*pattern);
    writer.Terminate();
}

// Replaces the runs one after another, each time searching the working copy again from its
// start, so that a run cut short at the end of the working copy is expanded by what is left.
template <class WriteRun>
void ExpandRuns(const wchar_t* pattern, wchar_t* out, WriteRun writeRun) {
    wchar_t work[kPathCapacity];
    CopyBounded(pattern, work);
    const wchar_t* run = std::wcschr(work, kPadding);
    if (!run) {
        std::wmemcpy(out, work, std::wcslen(work) + 1);
        return;
    }
    while (run) {
        std::size_t start = static_cast<std::size_t>(run - work);
        std::size_t width = std::wcsspn(run, L"#");
        Writer writer(out);
        writer.Put(work, start);
        writeRun(writer, width);
        for (const wchar_t* rest = run + width; *rest; ++rest)
            writer.Put(*rest);
        writer.Terminate();
        std::wmemcpy(work, out, writer.Length() + 1);
        run = std::wcschr(work, kPadding);
    }
}

} // namespace
} // namespace ut

void KXExpandFramePadding(const wchar_t* pattern, long frame, wchar_t* out) {
    ut::ExpandRuns(pattern, out,
                   [frame](ut::Writer& writer, std::size_t width) { writer.PutNumber(frame, width); });
}

void KXExpandFramePadding_Range(const wchar_t* pattern, long first, long last, wchar_t* out) {
    ut::ExpandRuns(pattern, out, [first, last](ut::Writer& writer, std::size_t width) {
        writer.PutNumber(first, width);
        writer.Put(L'_');
        writer.PutNumber(last, width);
    });
}

void KXRemoveFramePadding(const wchar_t* pattern, wchar_t* out) {
    wchar_t work[ut::kPathCapacity];
    ut::CopyBounded(pattern, work);
    std::size_t written = 0;
    for (std::size_t i = 0; work[i]; ++i) {
        if (work[i] != ut::kPadding) {
            out[written++] = work[i];
            continue;
        }
        // The first '#' of a run takes a full stop or backslash just before it along.
        if (i > 0 && (work[i - 1] == L'.' || work[i - 1] == L'\\'))
            --written;
    }
    out[written] = L'\0';
}
