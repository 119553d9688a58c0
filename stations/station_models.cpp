// The model rules over the string table's texts.
#include "stations/station_models.h"

#include "res/resource.h"
#include "support/text_lookup.h"

ModelKind StationModelKind(const std::wstring& model) {
    return ClassifyModel(model, LoadUiText(IDS_MODEL_LV20), LoadUiText(IDS_MODEL_LV30));
}

std::wstring FirstModelText() {
    return LoadUiText(IDS_MODEL_LV10);
}

std::wstring KnownModelOrFirst(const std::wstring& model) {
    return IsExternalLibraryModel(model) ? model : FirstModelText();
}

std::wstring ModelInstructionText(const std::wstring& model) {
    return LoadUiText(ModelInstructionTextId(StationModelKind(model)));
}

bool IsExternalLibraryModel(const std::wstring& model) {
    return UsesExternalLibrary(StationModelKind(model));
}

std::wstring StationFileName(const std::wstring& model) {
    return ModelFileName(StationModelKind(model));
}
