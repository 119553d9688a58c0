// The model rules: transfer path, file name and instructions by the model's text.
#include "stations/portable/model_rules.h"

#include "res/ids_stations.h"

ModelKind ClassifyModel(WideStringView model, WideStringView lv20Text,
                        WideStringView lv30Text) noexcept {
    if (model == lv20Text)
        return ModelKind::kExternalLv20;
    if (model == lv30Text)
        return ModelKind::kExternalLv30;
    return ModelKind::kBuiltInDriver;
}

bool UsesExternalLibrary(ModelKind kind) noexcept {
    return kind != ModelKind::kBuiltInDriver;
}

const WideChar* ModelFileName(ModelKind kind) noexcept {
    return UsesExternalLibrary(kind) ? WIDE_TEXT("file1.hvr") : WIDE_TEXT("file1.lv");
}

uint32_t ModelInstructionTextId(ModelKind kind) noexcept {
    switch (kind) {
        case ModelKind::kExternalLv20:
            return IDS_INSTRUCTIONS_LV20;
        case ModelKind::kExternalLv30:
            return IDS_INSTRUCTIONS_LV30;  // the same text as the LV-20's, kept as its own entry
        default:
            return IDS_INSTRUCTIONS_LV10;
    }
}
