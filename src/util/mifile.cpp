// The header reader of exported scene description files: the first block of "set" lines.
#include <cstddef>
#include <cstdlib>
#include <cstring>

#include <ut/mifile.h>
#include <ut/platform/input_file.h>
#include <ut/platform/strings.h>

namespace ut {
namespace {

// 499 characters of a line and its terminator.
constexpr std::size_t kLineBuffer = 500;
// The block must start within this many lines.
constexpr int kLinesSearched = 100;

// Hands out the lines of a file as a text-mode stream's getline(line, 500) does: without the line
// end (a carriage return before it goes too); a line longer than 499 characters is cut there and
// ends the file; past the end every line is empty. Reads small pieces, so that nothing much
// beyond the last line asked for is read.
class LineReader {
public:
    explicit LineReader(platform::InputFile* file) : file_(file) {}

    // The next line, terminated, in `line`.
    void Next(char (&line)[kLineBuffer]) {
        std::size_t length = 0;
        while (!ended_) {
            int c = Get();
            if (c == '\r' && Peek() == '\n')
                c = Get();
            if (c < 0 || (c != '\n' && length == kLineBuffer - 1))
                ended_ = true;
            else if (c == '\n')
                break;
            else
                line[length++] = static_cast<char>(c);
        }
        line[length] = '\0';
    }

private:
    int Peek() {
        if (position_ == size_) {
            size_ = platform::ReadInputFile(file_, buffer_, sizeof buffer_);
            position_ = 0;
            if (size_ == 0)
                return -1;
        }
        return buffer_[position_];
    }
    int Get() {
        int c = Peek();
        if (c >= 0)
            ++position_;
        return c;
    }

    platform::InputFile* file_;
    unsigned char buffer_[512];
    std::size_t position_ = 0;
    std::size_t size_ = 0;
    bool ended_ = false;
};

// Splits a line in place as the C runtime's strtok does: leading delimiters are skipped and the
// one delimiter after a token is consumed, so the next call may skip a different set.
class Tokens {
public:
    explicit Tokens(char* text) : next_(text) {}

    const char* Next(const char* delimiters) {
        char* start = next_ + std::strspn(next_, delimiters);
        char* stop = start + std::strcspn(start, delimiters);
        next_ = *stop ? stop + 1 : stop;
        if (start == stop)
            return nullptr;
        *stop = '\0';
        return start;
    }

private:
    char* next_;
};

struct Header {
    long* begin;
    long* end;
    long* step;
    long* field;
    char** sceneName;
    char** translator;
};

// Only the space character is skipped; a tab keeps a line out of the block.
char* SkipSpaces(char* line) {
    while (*line == ' ')
        ++line;
    return line;
}

bool StartsBlock(const char* line) {
    return std::strncmp(line, "set", 3) == 0;
}

char* Duplicate(const char* text) {
    std::size_t size = std::strlen(text) + 1;
    char* copy = static_cast<char*>(std::malloc(size));
    if (copy)
        std::memcpy(copy, text, size);
    return copy;
}

long* IntegerOutput(const Header& header, const char* keyword) {
    const struct {
        const char* keyword;
        long* output;
    } integers[] = {
        {"begin", header.begin}, {"end", header.end}, {"step", header.step}, {"field", header.field}};
    for (const auto& integer : integers)
        if (std::strcmp(keyword, integer.keyword) == 0)
            return integer.output;
    return nullptr;
}

void ParseLine(char* line, const Header& header) {
    Tokens tokens(line);
    (void)tokens.Next(" "); // "set", or a longer word that begins with it
    const char* keyword = tokens.Next(" \"");
    if (!keyword)
        return;
    if (long* integer = IntegerOutput(header, keyword)) {
        if (const char* value = tokens.Next(" \""))
            *integer = platform::BytesToLong(value);
        return;
    }
    char** text;
    if (std::strcmp(keyword, "scene_name") == 0)
        text = header.sceneName;
    else if (std::strcmp(keyword, "translator") == 0)
        text = header.translator;
    else
        return;
    // The first piece cut at quotes is skipped: with exactly one space before the opening quote
    // that piece is the quoted text itself, and nothing is taken.
    (void)tokens.Next("\"");
    const char* value = tokens.Next("\"");
    if (value && text)
        *text = Duplicate(value); // an earlier copy stays with the caller
}

} // namespace
} // namespace ut

long KXReadMIFileHeader(char* fileName, long* begin, long* end, long* step, long* field, char** sceneName,
                        char** translator) {
    if (!begin || !end || !step || !field)
        return E_INVALIDARG;
    *begin = 1;
    *end = 1;
    *step = 1;
    *field = 0;
    ut::platform::InputFilePtr file(ut::platform::OpenInputFile(fileName));
    if (!file)
        return E_FAIL;
    ut::LineReader reader(file.get());
    char line[ut::kLineBuffer] = {};
    char* text = line;
    for (int read = 0; !ut::StartsBlock(text); ++read) {
        if (read == ut::kLinesSearched)
            return E_FAIL;
        reader.Next(line);
        text = ut::SkipSpaces(line);
    }
    const ut::Header header{begin, end, step, field, sceneName, translator};
    do {
        ut::ParseLine(text, header);
        reader.Next(line);
        text = ut::SkipSpaces(line);
    } while (ut::StartsBlock(text));
    return S_OK;
}
