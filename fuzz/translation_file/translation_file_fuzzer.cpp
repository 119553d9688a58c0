// Feeds arbitrary bytes to the translation-file parser: it must neither crash nor read past them.
#include <cstddef>
#include <cstdint>
#include <vector>

#include "support/portable/translation_file.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    // A copy of exactly the input's size, so that AddressSanitizer sees any read beyond it.
    std::vector<uint8_t> bytes(data, data + size);
    TranslationMap map;
    const bool parsed = ParseTranslationFile(bytes.data(), bytes.size(), map);
    if (!parsed && !map.empty())
        __builtin_trap();  // a rejected file must leave the map untouched
    for (const auto& [english, translation] : map) {
        if (english.empty())
            __builtin_trap();  // an empty English text can never be looked up
    }
    return 0;
}
