// Feeds arbitrary bytes to the script decoder and parser: no crash, no overrun, and a rejected
// script never leaves operations behind.
#include <cstdint>
#include <cstdlib>

#include "server/portable/registry_script.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    WideString text;
    if (!DecodeRegistryScriptBytes(data, size, text))
        return 0;
    static const std::vector<RegistryScriptReplacement> replacements = {
        {WIDE_TEXT("MODULE"), WIDE_TEXT("C:\\it's {a} %path%.dll")}};
    std::vector<RegistryKeyOperation> operations;
    RegistryScriptError error;
    const bool parsed = ParseRegistryScript(text, replacements, operations, error);
    if (!parsed && !operations.empty())
        std::abort();
    for (const RegistryKeyOperation& operation : operations) {
        if (operation.path.empty() || operation.depth == 0 ||
            operation.depth > kMaxRegistryScriptDepth ||
            (operation.noRemove && operation.forceRemove))
            std::abort();
    }
    return 0;
}
