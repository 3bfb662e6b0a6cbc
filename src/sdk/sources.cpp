// The application's comparison of file paths.
#include <cwctype>

#include <ut/sdk/sources.h>

namespace {

wchar_t Folded(wchar_t c) {
    return c == L'/' ? L'\\' : static_cast<wchar_t>(std::towlower(static_cast<wint_t>(c)));
}

} // namespace

BOOL GWFilePathsEqual(const wchar_t* first, const wchar_t* second) {
    if (!first || !second)
        return first == second;
    for (; *first && *second; ++first, ++second)
        if (Folded(*first) != Folded(*second))
            return FALSE;
    return *first == *second;
}
