// This module found from the address of its own code (no DllMain bookkeeping), module paths that
// grow their buffer, and the system's message texts.
#include "support/module_instance.h"

#include "support/unique_resource.h"

HMODULE ThisModule() noexcept {
    HMODULE module = nullptr;
    // The flag UNCHANGED_REFCOUNT: the module outlives every caller, so no reference is taken.
    ::GetModuleHandleExW(
        GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
        reinterpret_cast<LPCWSTR>(&ThisModule), &module);
    return module;
}

std::wstring ModuleFilePath(HMODULE module) {
    std::wstring path(MAX_PATH, L'\0');
    for (;;) {
        const DWORD length =
            ::GetModuleFileNameW(module, path.data(), static_cast<DWORD>(path.size()));
        if (length == 0)
            return {};
        // A path that fills the buffer may have been cut: try again with twice the room.
        if (length < path.size()) {
            path.resize(length);
            return path;
        }
        path.resize(path.size() * 2);
    }
}

std::wstring ThisModulePath() {
    return ModuleFilePath(ThisModule());
}

std::wstring SystemMessageText(DWORD code, const std::wstring& insert) {
    DWORD_PTR arguments[1] = {reinterpret_cast<DWORD_PTR>(insert.c_str())};
    DWORD flags = FORMAT_MESSAGE_ALLOCATE_BUFFER | FORMAT_MESSAGE_FROM_SYSTEM;
    flags |= insert.empty() ? FORMAT_MESSAGE_IGNORE_INSERTS : FORMAT_MESSAGE_ARGUMENT_ARRAY;
    wchar_t* buffer = nullptr;
    const DWORD length =
        ::FormatMessageW(flags, nullptr, code, 0, reinterpret_cast<wchar_t*>(&buffer), 0,
                         insert.empty() ? nullptr : reinterpret_cast<va_list*>(arguments));
    const UniqueLocalMemory owner(buffer);
    std::wstring text;
    if (length != 0 && buffer)
        text.assign(buffer, length);
    while (!text.empty() && (text.back() == L'\n' || text.back() == L'\r' || text.back() == L' '))
        text.pop_back();
    return text;
}

std::wstring SystemResultText(HRESULT result, const std::wstring& insert) {
    std::wstring text = SystemMessageText(static_cast<DWORD>(result), insert);
    // Some systems keep their texts under the bare Win32 code only.
    if (text.empty() && HRESULT_FACILITY(result) == FACILITY_WIN32)
        text = SystemMessageText(HRESULT_CODE(result), insert);
    if (text.empty()) {
        wchar_t fallback[32] = {};
        ::wsprintfW(fallback, L"0x%08X", static_cast<unsigned>(result));
        text = fallback;
        if (!insert.empty())
            text += L" (" + insert + L")";
    }
    return text;
}
