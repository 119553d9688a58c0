// What a station's model decides: which transfer path downloads its file, what the file is
// called and which key-by-key instructions the dialog shows. The model is known by its text.
#pragma once

#include <cstdint>

#include "support/portable/wide_text.h"

enum class ModelKind {
    kBuiltInDriver,  // the first model and any text that is not one of the two others
    kExternalLv20,   // served by the instrument maker's communication library
    kExternalLv30,
};

// Compares exactly with the current texts of the two models of the external library.
ModelKind ClassifyModel(WideStringView model, WideStringView lv20Text,
                        WideStringView lv30Text) noexcept;

bool UsesExternalLibrary(ModelKind kind) noexcept;

// "file1.hvr" for the models of the external library, "file1.lv" for every other model.
const WideChar* ModelFileName(ModelKind kind) noexcept;

// The string-table text with the instrument's key-by-key instructions.
uint32_t ModelInstructionTextId(ModelKind kind) noexcept;
