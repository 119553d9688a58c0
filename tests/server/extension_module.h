// The built extension DLL loaded into a test process, with its four exports.
#pragma once

#include <windows.h>
#include <unknwn.h>

#include <gtest/gtest.h>

#include <string>

#include "support/unique_resource.h"

// The DLL's path as Wine sees it: the build tree's path on drive Z:, which maps the host's root.
inline std::wstring ExtensionDllPath() {
    const std::string hostPath = LV_EXTENSION_DLL_PATH;
    std::wstring path = hostPath.front() == '/' ? L"Z:" : L"";
    for (char c : hostPath)
        path.push_back(c == '/' ? L'\\' : static_cast<wchar_t>(c));
    return path;
}

class ExtensionModule {
public:
    ExtensionModule() : module_(::LoadLibraryW(ExtensionDllPath().c_str())) {
        EXPECT_TRUE(module_) << "LoadLibrary failed: " << ::GetLastError();
    }

    HRESULT GetClassObject(REFCLSID classId, REFIID iid, void** object) const {
        return Export<HRESULT(STDAPICALLTYPE*)(REFCLSID, REFIID, void**)>("DllGetClassObject")(
            classId, iid, object);
    }
    HRESULT CanUnloadNow() const { return Export<HRESULT(STDAPICALLTYPE*)()>("DllCanUnloadNow")(); }
    HRESULT Register() const { return Export<HRESULT(STDAPICALLTYPE*)()>("DllRegisterServer")(); }
    HRESULT Unregister() const {
        return Export<HRESULT(STDAPICALLTYPE*)()>("DllUnregisterServer")();
    }

private:
    template <typename Function>
    Function Export(const char* name) const {
        auto function = reinterpret_cast<Function>(
            reinterpret_cast<void*>(::GetProcAddress(module_.get(), name)));
        EXPECT_NE(nullptr, reinterpret_cast<void*>(function)) << name;
        return function;
    }

    UniqueHModule module_;
};

inline constexpr CLSID kShellFolderClassId = {
    0x7D3F2A61, 0x4B8E, 0x4C19, {0x9A, 0x27, 0x5E, 0x0C, 0x81, 0xB6, 0xD4, 0xF3}};
inline constexpr CLSID kContextMenuClassId = {
    0x1C6E9B4A, 0xF5D2, 0x4B73, {0x8E, 0x29, 0xA0, 0x3F, 0x6C, 0x7D, 0x51, 0xE4}};
inline constexpr CLSID kExtractIconClassId = {
    0x9E2B6D14, 0x7C3A, 0x4F85, {0xB1, 0xD9, 0x36, 0xA8, 0xE0, 0x5C, 0x7F, 0x21}};
inline constexpr CLSID kQueryInfoClassId = {
    0x5A91C3E7, 0x2F04, 0x4B6D, {0x8E, 0x13, 0xA7, 0xC2, 0xD9, 0x0F, 0x4B, 0x58}};
inline constexpr CLSID kEnumIdListClassId = {
    0x3B8C1F92, 0xA6D5, 0x4E07, {0x9C, 0x4B, 0xD2, 0x1F, 0x7A, 0x8E, 0x30, 0x65}};
