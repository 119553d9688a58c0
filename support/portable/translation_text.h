// Portable text rules of the text lookup.
#pragma once

#include "support/portable/wide_text.h"

// The text before its first "@@" (the translator's note is never shown); the whole text if none.
inline WideStringView CutTranslatorNote(WideStringView text) noexcept {
    const size_t note = text.find(WIDE_TEXT("@@"));
    return note == WideStringView::npos ? text : text.substr(0, note);
}
