// Applies registry key operations to the registry, and registers the module's type library.
#include "server/registrar.h"

#include <oleauto.h>
#include <wrl/client.h>

#include <string>

#include "support/error_handling.h"
#include "support/module_instance.h"
#include "support/registry_value.h"
#include "support/unique_resource.h"

namespace {

HKEY RootKey(RegistryRoot root) noexcept {
    switch (root) {
        case RegistryRoot::ClassesRoot:
            return HKEY_CLASSES_ROOT;
        case RegistryRoot::CurrentUser:
            return HKEY_CURRENT_USER;
        case RegistryRoot::LocalMachine:
            return HKEY_LOCAL_MACHINE;
        case RegistryRoot::Users:
            return HKEY_USERS;
        case RegistryRoot::CurrentConfig:
            return HKEY_CURRENT_CONFIG;
    }
    return HKEY_CLASSES_ROOT;
}

bool IsGone(LONG status) noexcept {
    return status == ERROR_FILE_NOT_FOUND || status == ERROR_PATH_NOT_FOUND;
}

LONG WriteValue(HKEY key, const RegistryScriptValue& value) noexcept {
    const wchar_t* name = value.name.empty() ? nullptr : value.name.c_str();
    if (value.type == RegistryValueType::Dword) {
        const DWORD number = value.number;
        return ::RegSetValueExW(key, name, 0, REG_DWORD, reinterpret_cast<const BYTE*>(&number),
                                sizeof number);
    }
    return ::RegSetValueExW(key, name, 0, REG_SZ, reinterpret_cast<const BYTE*>(value.text.c_str()),
                            static_cast<DWORD>((value.text.size() + 1) * sizeof(wchar_t)));
}

HRESULT RegisterKey(const RegistryKeyOperation& operation) noexcept {
    const HKEY root = RootKey(operation.root);
    if (operation.forceRemove) {
        const LONG status = DeleteKeyRecursive(root, operation.path.c_str());
        if (!IsGone(status))
            RETURN_IF_WIN32_ERROR(status);
    }
    UniqueRegKey key;
    RETURN_IF_WIN32_ERROR(::RegCreateKeyExW(root, operation.path.c_str(), 0, nullptr,
                                            REG_OPTION_NON_VOLATILE, KEY_SET_VALUE, nullptr,
                                            key.put(), nullptr));
    if (operation.defaultValue)
        RETURN_IF_WIN32_ERROR(WriteValue(key.get(), *operation.defaultValue));
    for (const RegistryScriptValue& value : operation.values)
        RETURN_IF_WIN32_ERROR(WriteValue(key.get(), value));
    return S_OK;
}

HRESULT UnregisterKey(const RegistryKeyOperation& operation) noexcept {
    const HKEY root = RootKey(operation.root);
    if (operation.forceRemove) {
        const LONG status = DeleteKeyRecursive(root, operation.path.c_str());
        if (!IsGone(status))
            RETURN_IF_WIN32_ERROR(status);
        return S_OK;
    }
    UniqueRegKey key;
    const LONG opened =
        ::RegOpenKeyExW(root, operation.path.c_str(), 0, KEY_SET_VALUE | KEY_READ, key.put());
    if (IsGone(opened))
        return S_OK;
    RETURN_IF_WIN32_ERROR(opened);
    for (const RegistryScriptValue& value : operation.values) {
        const LONG status = ::RegDeleteValueW(key.get(), value.name.c_str());
        if (!IsGone(status))
            RETURN_IF_WIN32_ERROR(status);
    }
    if (operation.noRemove)
        return S_OK;
    // Subkeys that the script did not make belong to someone else: the key stays for them.
    DWORD subkeyCount = 0;
    RETURN_IF_WIN32_ERROR(::RegQueryInfoKeyW(key.get(), nullptr, nullptr, nullptr, &subkeyCount,
                                             nullptr, nullptr, nullptr, nullptr, nullptr, nullptr,
                                             nullptr));
    key.reset();
    if (subkeyCount != 0)
        return S_OK;
    const LONG deleted = ::RegDeleteKeyW(root, operation.path.c_str());
    if (!IsGone(deleted))
        RETURN_IF_WIN32_ERROR(deleted);
    return S_OK;
}

}  // namespace

HRESULT ApplyRegistryOperations(const std::vector<RegistryKeyOperation>& operations,
                                RegistrationMode mode) noexcept {
    if (mode == RegistrationMode::Register) {
        for (const RegistryKeyOperation& operation : operations)
            RETURN_IF_FAILED(RegisterKey(operation));
        return S_OK;
    }
    // Parents come before their children in the script, so the reverse order empties a key
    // before it is considered for deletion.
    for (auto operation = operations.rbegin(); operation != operations.rend(); ++operation)
        RETURN_IF_FAILED(UnregisterKey(*operation));
    return S_OK;
}

HRESULT RunRegistryScript(std::wstring_view script,
                          const std::vector<RegistryScriptReplacement>& replacements,
                          RegistrationMode mode) noexcept {
    try {
        std::vector<RegistryKeyOperation> operations;
        RegistryScriptError error;
        RETURN_HR_IF(HRESULT_FROM_WIN32(ERROR_INVALID_DATA),
                     !ParseRegistryScript(script, replacements, operations, error));
        return ApplyRegistryOperations(operations, mode);
    }
    CATCH_RETURN()
}

HRESULT ParseRegistryResource(HMODULE module, UINT resourceId, std::wstring_view modulePath,
                              std::vector<RegistryKeyOperation>& operations) noexcept {
    try {
        const HRSRC found = ::FindResourceW(module, MAKEINTRESOURCEW(resourceId), L"REGISTRY");
        RETURN_IF_WIN32_BOOL_FALSE(found);
        const HGLOBAL loaded = ::LoadResource(module, found);
        RETURN_IF_WIN32_BOOL_FALSE(loaded);
        const auto* bytes = static_cast<const uint8_t*>(::LockResource(loaded));
        RETURN_IF_NULL_ALLOC(bytes);
        WideString script;
        RegistryScriptError error;
        RETURN_HR_IF(HRESULT_FROM_WIN32(ERROR_INVALID_DATA),
                     !DecodeRegistryScriptBytes(bytes, ::SizeofResource(module, found), script) ||
                         !ParseRegistryScript(script, {{L"MODULE", WideString(modulePath)}},
                                              operations, error));
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT RunRegistryResource(HMODULE module, UINT resourceId, RegistrationMode mode) noexcept {
    try {
        const std::wstring path = ModuleFilePath(module);
        RETURN_IF_WIN32_BOOL_FALSE(!path.empty());
        std::vector<RegistryKeyOperation> operations;
        RETURN_IF_FAILED(ParseRegistryResource(module, resourceId, path, operations));
        return ApplyRegistryOperations(operations, mode);
    }
    CATCH_RETURN()
}

HRESULT RegisterModuleTypeLibrary(HMODULE module, RegistrationMode mode) noexcept {
    try {
        std::wstring path = ModuleFilePath(module);
        RETURN_IF_WIN32_BOOL_FALSE(!path.empty());
        Microsoft::WRL::ComPtr<ITypeLib> library;
        RETURN_IF_FAILED(::LoadTypeLibEx(path.c_str(), REGKIND_NONE, &library));
        if (mode == RegistrationMode::Register)
            return ::RegisterTypeLib(library.Get(), path.data(), nullptr);
        TLIBATTR* attributes = nullptr;
        RETURN_IF_FAILED(library->GetLibAttr(&attributes));
        const TLIBATTR copy = *attributes;
        library->ReleaseTLibAttr(attributes);
        return ::UnRegisterTypeLib(copy.guid, copy.wMajorVerNum, copy.wMinorVerNum, copy.lcid,
                                   copy.syskind);
    }
    CATCH_RETURN()
}
