// UTF-16 text type shared by the portable code and the Win32 code (wchar_t there, char16_t
// elsewhere).
#pragma once

#include <string>
#include <string_view>

#if defined(_WIN32)
using WideChar = wchar_t;
#define WIDE_TEXT(text) L##text
#else
using WideChar = char16_t;
#define WIDE_TEXT(text) u##text
#endif

static_assert(sizeof(WideChar) == 2, "the wire and registry forms are UTF-16");

using WideString = std::basic_string<WideChar>;
using WideStringView = std::basic_string_view<WideChar>;

// Length of a NUL-terminated text that lies in a buffer of at most maxCount units; the text may
// lack its terminator, in which case maxCount is returned.
inline size_t BoundedLength(const WideChar* text, size_t maxCount) noexcept {
    size_t length = 0;
    while (length < maxCount && text[length] != 0)
        ++length;
    return length;
}
