// Texts of the station file: strict UTF-8 lines, and the plain or quoted form of one text.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "support/portable/wide_text.h"

// Messages are English and built from ASCII pieces.
WideString AsciiWide(std::string_view ascii);
WideString DecimalWide(uint64_t value);

enum class LineDecoding {
    kDecoded,
    kInvalidUtf8,  // an overlong form, a surrogate, a code point above U+10FFFF, a cut sequence
    kControlCharacter,  // anything below U+0020 but the tab, and DEL: a text needing one is quoted
};

// Decodes one line (without its line end) to UTF-16. On failure, column is the 1-based byte
// position of the offending byte.
LineDecoding DecodeUtf8Line(std::string_view bytes, WideString& text, size_t& column);

// Spaces and tabs at both ends removed.
WideStringView TrimBlanks(WideStringView text) noexcept;

// A text as the file writes it: as it stands where that reads back the same, otherwise in double
// quotes with \\, \", \t and \uHHHH (any other control character, DEL, and a UTF-16 surrogate
// without its partner, which UTF-8 cannot carry) escaped. Quoted are texts with blanks at either
// end, texts that begin with a double quote, and texts with such characters.
std::string EncodeFileText(WideStringView text);

// The reverse, for a text already trimmed of blanks: a text that begins with a double quote must
// be one quoted text, up to a closing quote at its very end; anything else stands as written.
// The reason on failure (no closing quote, text after it, an unknown escape).
std::optional<WideString> DecodeFileText(WideStringView written, WideString& text);

// UTF-16 to UTF-8; a surrogate without its partner becomes U+FFFD (EncodeFileText never leaves
// one unquoted).
void AppendUtf8(std::string& out, WideStringView text);
