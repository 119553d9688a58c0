// Scratch registry hives for tests, removed again when the test ends.
#include "tests/support/registry_override.h"

#include <gtest/gtest.h>

#include <cwchar>

#include "support/registry_value.h"

namespace {

const wchar_t kScratchRoot[] = L"Software\\LVShellExt Tests";

std::wstring UniqueScratchPath() {
    GUID guid{};
    EXPECT_EQ(S_OK, ::CoCreateGuid(&guid));
    wchar_t text[64];
    ::StringFromGUID2(guid, text, ARRAYSIZE(text));
    return std::wstring(kScratchRoot) + L"\\" + text;
}

UniqueRegKey CreateScratchKey(const std::wstring& path) {
    UniqueRegKey key;
    EXPECT_EQ(ERROR_SUCCESS, ::RegCreateKeyExW(HKEY_CURRENT_USER, path.c_str(), 0, nullptr,
                                               REG_OPTION_NON_VOLATILE, KEY_ALL_ACCESS, nullptr,
                                               key.put(), nullptr));
    return key;
}

}  // namespace

RegistryOverride::RegistryOverride(Hives hives) : scratchPath_(UniqueScratchPath()) {
    currentUser_ = CreateScratchKey(scratchPath_ + L"\\HKCU");
    if (hives == Hives::CurrentUserAndLocalMachine) {
        localMachine_ = CreateScratchKey(scratchPath_ + L"\\HKLM");
        EXPECT_EQ(ERROR_SUCCESS, ::RegOverridePredefKey(HKEY_LOCAL_MACHINE, localMachine_.get()));
    }
    EXPECT_EQ(ERROR_SUCCESS, ::RegOverridePredefKey(HKEY_CURRENT_USER, currentUser_.get()));
}

RegistryOverride::~RegistryOverride() {
    ::RegOverridePredefKey(HKEY_CURRENT_USER, nullptr);
    if (localMachine_)
        ::RegOverridePredefKey(HKEY_LOCAL_MACHINE, nullptr);
    currentUser_.reset();
    localMachine_.reset();
    // Scratch keys live under the real user's hive, which is the private prefix's.
    EXPECT_EQ(ERROR_SUCCESS, DeleteKeyRecursive(HKEY_CURRENT_USER, scratchPath_.c_str()));
}

void RegistryOverride::SetSerialPorts(const std::vector<std::wstring>& ports) {
    ASSERT_TRUE(localMachine_) << "construct with Hives::CurrentUserAndLocalMachine";
    UniqueRegKey key;
    ASSERT_EQ(
        ERROR_SUCCESS,
        ::RegCreateKeyExW(HKEY_LOCAL_MACHINE, L"HARDWARE\\DEVICEMAP\\SERIALCOMM", 0, nullptr,
                          REG_OPTION_NON_VOLATILE, KEY_ALL_ACCESS, nullptr, key.put(), nullptr));
    for (size_t index = 0; index < ports.size(); ++index) {
        wchar_t device[32];
        swprintf(device, ARRAYSIZE(device), L"\\Device\\Serial%u", static_cast<unsigned>(index));
        ASSERT_EQ(ERROR_SUCCESS, WriteStringValue(key.get(), device, ports[index]));
    }
}
