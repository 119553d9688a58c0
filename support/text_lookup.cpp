// String-table access for the text lookup.
#include "support/text_lookup.h"

#include "support/module_instance.h"
#include "support/portable/translation_text.h"

std::wstring LoadEnglishString(HMODULE module, UINT id) {
    // Strings live in blocks of 16; block n holds ids (n - 1) * 16 to n * 16 - 1.
    const HRSRC resource = ::FindResourceExW(module, RT_STRING, MAKEINTRESOURCEW(id / 16 + 1),
                                             MAKELANGID(LANG_ENGLISH, SUBLANG_ENGLISH_US));
    if (!resource)
        return {};
    const HGLOBAL loaded = ::LoadResource(module, resource);
    const DWORD size = ::SizeofResource(module, resource);
    const auto* block = static_cast<const WCHAR*>(loaded ? ::LockResource(loaded) : nullptr);
    if (!block)
        return {};
    // Each entry is a length word followed by that many characters; walk within the block's size.
    const size_t units = size / sizeof(WCHAR);
    size_t offset = 0;
    for (UINT index = 0; index < id % 16; ++index) {
        if (offset >= units)
            return {};
        offset += 1 + block[offset];
    }
    if (offset >= units)
        return {};
    const size_t length = block[offset];
    if (offset + 1 + length > units)
        return {};
    return std::wstring(block + offset + 1, length);
}

std::wstring LoadUiText(UINT id) {
    return std::wstring(CutTranslatorNote(LoadEnglishString(ThisModule(), id)));
}
