// lvconsume's report: each step it took, printed as it goes, and the failure that ends the run.
#pragma once

#include <windows.h>

#include <string>

std::wstring Hex(HRESULT code);
std::wstring Quoted(const std::wstring& text);
// Prints "step: TEXT" on its own line.
void Step(const std::wstring& text);

// The failure that ends the run: what was checked and the code it came with. The checks return
// Fail's false, so a check reads "if (bad) return failure.Fail(...)".
class FailureRecord {
public:
    bool Fail(std::wstring what, HRESULT code) {
        what_ = std::move(what);
        code_ = code;
        return false;
    }
    const std::wstring& what() const noexcept { return what_; }
    HRESULT code() const noexcept { return code_; }

private:
    std::wstring what_;
    HRESULT code_ = S_OK;
};
