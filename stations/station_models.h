// The model rules against the string table's current model texts (a translation renames them).
#pragma once

#include <string>

#include "stations/portable/model_rules.h"

ModelKind StationModelKind(const std::wstring& model);

// The text of the first model: the default, and what any unknown model reads back as.
std::wstring FirstModelText();
// The model itself when it is one of the three, else the first model's text.
std::wstring KnownModelOrFirst(const std::wstring& model);

std::wstring ModelInstructionText(const std::wstring& model);
bool IsExternalLibraryModel(const std::wstring& model);
std::wstring StationFileName(const std::wstring& model);
