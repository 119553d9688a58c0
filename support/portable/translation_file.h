// Parser of the translation files: bracketed pairs of English text and translation.
#pragma once

#include <cstddef>
#include <cstdint>
#include <map>

#include "support/portable/wide_text.h"

// English text (exact, case-sensitive, translator's note included) to its translation.
using TranslationMap = std::map<WideString, WideString>;

// Decodes "\n", "\t", "\r" and "\\" one after the other, in that order, as the loader always has:
// a backslash pair followed by n, t or r therefore reads as a backslash and the control character.
WideString DecodeTranslationEscapes(WideStringView text);

// Reads the pairs of one file's bytes into map (entries already there are kept). The file is
// UTF-16LE after the byte-order mark FF FE; without it, UTF-16LE is recognised by a zero second
// byte and anything else is read as UTF-8 (an EF BB BF mark is skipped). A line that begins with
// "[" holds one text up to the last "]" of the line; the first such line is the English text, the
// next one its translation. A blank line, or a "[" line without "]", drops an English line that
// is still waiting for its translation; every other line is a comment. The first pair of an
// English text wins. False, with map unchanged, when the bytes cannot be a translation file
// (fewer than 2 bytes, or UTF-16 big-endian) or memory runs out.
[[nodiscard]] bool ParseTranslationFile(const uint8_t* bytes, size_t size,
                                        TranslationMap& map) noexcept;

// The file's bytes as UTF-16 text by the rules above; false, and no text, for the rejected forms
// and when memory runs out.
[[nodiscard]] bool DecodeTranslationFileText(const uint8_t* bytes, size_t size,
                                             WideString& text) noexcept;
