// lvconsume's report: the step lines and the texts in them.
#include "tools/lvconsume/consumer_steps.h"

#include <cwchar>

#include "tools/common/console_output.h"

std::wstring Hex(HRESULT code) {
    wchar_t text[16];
    swprintf(text, ARRAYSIZE(text), L"0x%08lX", static_cast<unsigned long>(code));
    return text;
}

std::wstring Quoted(const std::wstring& text) {
    return L"\"" + text + L"\"";
}

void Step(const std::wstring& text) {
    PrintUtf8(L"step: " + text + L"\n");
}
