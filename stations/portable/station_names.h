// Naming rules of stations: unique names for new and pasted stations, and the allowed characters.
#pragma once

#include <functional>

#include "support/portable/wide_text.h"

using NameTakenPredicate = std::function<bool(const WideString& name)>;

// The base itself, else the base followed by " (2)", " (3)", … : the first name not taken.
WideString MakeUniqueName(const WideString& base, const NameTakenPredicate& isTaken);

// The name of a pasted station: the copy prefix put in front again and again until it is free.
WideString MakePastedName(const WideString& name, const WideString& copyPrefix,
                          const NameTakenPredicate& isTaken);

// Non-empty and free of backslash, slash, double quote and asterisk.
bool IsValidStationName(WideStringView name) noexcept;
