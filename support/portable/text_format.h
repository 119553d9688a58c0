// Filling the "%s" places of a user-visible text, English or translated.
#pragma once

#include <initializer_list>
#include <span>

#include "support/portable/wide_text.h"

// Replaces each %s or %d of format by the next argument, in order, and %% by %. A conversion
// without an argument left is dropped, so a mistranslated text cannot read past the list; an
// argument's own "%s" is never filled.
[[nodiscard]] WideString FormatText(WideStringView format,
                                    std::span<const WideStringView> arguments);

[[nodiscard]] inline WideString FormatText(WideStringView format,
                                           std::initializer_list<WideStringView> arguments) {
    return FormatText(format, std::span<const WideStringView>(arguments.begin(), arguments.size()));
}
