// The names of the stations an operation could not change, as one message lists them: bounded,
// since a user can select a thousand stations and a message box must still fit the screen.
#pragma once

#include <cstddef>
#include <initializer_list>
#include <span>

#include "support/portable/wide_text.h"

// The most names a message lists; the rest are counted.
inline constexpr size_t kMaximumNamesInMessage = 10;

// One name a line, each quoted and cut as NameForMessage does; past kMaximumNamesInMessage, one
// more line: moreFormat with the number of names left out in place of its %s.
WideString StationNamesForMessage(std::span<const WideString> names, WideStringView moreFormat);

// Replaces each %s of format by the next argument, in order; a %s without an argument left is
// dropped, so that a mistranslated text cannot read past the list.
WideString FillTextArguments(WideStringView format,
                             std::initializer_list<WideStringView> arguments);
