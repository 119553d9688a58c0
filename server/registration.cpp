// DllRegisterServer and DllUnregisterServer.
#include "server/registration.h"

#include <cwchar>

#include "server/lv_shell_folder.h"
#include "server/class_table.h"
#include "server/registrar.h"
#include "support/error_handling.h"
#include "support/unique_resource.h"

namespace {

// "CLSID\{7D3F2A61-4B8E-4C19-9A27-5E0C81B6D4F3}\ShellFolder", with the upper-case identifier
// text of StringFromGUID2.
bool ShellFolderKeyPath(wchar_t (&path)[MAX_PATH]) noexcept {
    wchar_t classIdText[40];
    if (::StringFromGUID2(CLSID_LVShellFolder, classIdText, ARRAYSIZE(classIdText)) == 0)
        return false;
    return std::swprintf(path, MAX_PATH, L"CLSID\\%ls\\ShellFolder", classIdText) > 0;
}

}  // namespace

HRESULT RegisterServer(HMODULE module) noexcept {
    for (const ClassTableEntry& entry : ClassTable())
        RETURN_IF_FAILED(
            RunRegistryResource(module, entry.registryScriptId, RegistrationMode::Register));
    RETURN_IF_FAILED(RegisterModuleTypeLibrary(module, RegistrationMode::Register));

    // The folder shows as browsable under My Computer only with these attributes; the shell reads
    // them as four bytes, which is why the value is binary and not a DWORD.
    wchar_t path[MAX_PATH];
    UniqueRegKey key;
    if (ShellFolderKeyPath(path) &&
        ::RegCreateKeyExW(HKEY_CLASSES_ROOT, path, 0, nullptr, REG_OPTION_NON_VOLATILE, KEY_WRITE,
                          nullptr, key.put(), nullptr) == ERROR_SUCCESS) {
        // A failure here is not reported: the classes themselves are registered.
        (void)::RegSetValueExW(key.get(), L"Attributes", 0, REG_BINARY, kShellFolderAttributes,
                               sizeof kShellFolderAttributes);
    }
    return S_OK;
}

HRESULT UnregisterServer(HMODULE module) noexcept {
    HRESULT result = S_OK;
    for (const ClassTableEntry& entry : ClassTable()) {
        result = RunRegistryResource(module, entry.registryScriptId, RegistrationMode::Unregister);
        if (FAILED(result))
            break;
    }
    if (SUCCEEDED(result)) {
        // Unregistration reports nothing: a library that was never registered is not an error.
        (void)RegisterModuleTypeLibrary(module, RegistrationMode::Unregister);
    }

    wchar_t path[MAX_PATH];
    if (ShellFolderKeyPath(path)) {
        // The value name with backslashes matches nothing in practice; the deletion is kept so
        // that an Attributes value stored under that odd name by an older version goes too.
        wchar_t oddValueName[MAX_PATH + 16];
        if (std::swprintf(oddValueName, ARRAYSIZE(oddValueName), L"%ls\\Attributes", path) > 0)
            (void)::RegDeleteValueW(HKEY_CLASSES_ROOT, oddValueName);
        // Opening creates the key: the empty ShellFolder key stays behind by design.
        UniqueRegKey key;
        if (::RegCreateKeyExW(HKEY_CLASSES_ROOT, path, 0, nullptr, REG_OPTION_NON_VOLATILE,
                              KEY_WRITE, nullptr, key.put(), nullptr) == ERROR_SUCCESS)
            (void)::RegDeleteValueW(key.get(), L"Attributes");  // absent is as good as deleted
    }
    return S_OK;
}
