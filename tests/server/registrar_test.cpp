// The registrar in both directions, on a scratch current-user hive.
#include <windows.h>

#include <gtest/gtest.h>

#include <string>

#include "server/registrar.h"
#include "support/registry_value.h"
#include "tests/support/registry_override.h"

namespace {

bool KeyExists(const wchar_t* path) {
    UniqueRegKey key;
    return ::RegOpenKeyExW(HKEY_CURRENT_USER, path, 0, KEY_READ, key.put()) == ERROR_SUCCESS;
}

std::wstring ReadText(const wchar_t* path, const wchar_t* name) {
    UniqueRegKey key;
    std::wstring text;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, path, 0, KEY_READ, key.put()) == ERROR_SUCCESS)
        ReadStringValue(key.get(), name, 1024, text);
    return text;
}

bool ValueExists(const wchar_t* path, const wchar_t* name) {
    UniqueRegKey key;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, path, 0, KEY_READ, key.put()) != ERROR_SUCCESS)
        return false;
    return ::RegQueryValueExW(key.get(), name, nullptr, nullptr, nullptr, nullptr) == ERROR_SUCCESS;
}

void CreateKeyWithValue(const wchar_t* path, const wchar_t* name, const wchar_t* text) {
    UniqueRegKey key;
    ASSERT_EQ(ERROR_SUCCESS, ::RegCreateKeyExW(HKEY_CURRENT_USER, path, 0, nullptr, 0,
                                               KEY_ALL_ACCESS, nullptr, key.put(), nullptr));
    if (name) {
        ASSERT_EQ(ERROR_SUCCESS, WriteStringValue(key.get(), name, text));
    }
}

const wchar_t kScript[] =
    LR"(HKCU
{
    NoRemove Software
    {
        NoRemove Shared
        {
            val Ours = s 'mine'
        }
        Product = s '%MODULE%'
        {
            Sub
            {
                val Count = d '7'
            }
        }
        ForceRemove Forced = s 'F'
        {
            Inner
        }
    }
}
)";

const std::vector<RegistryScriptReplacement> kModule = {{L"MODULE", L"C:\\x\\LVShellExt.dll"}};

}  // namespace

TEST(Registrar, RegisterWritesKeysValuesAndReplacesForceRemoveKeys) {
    RegistryOverride registry;
    CreateKeyWithValue(L"Software\\Forced\\Stale", nullptr, nullptr);
    ASSERT_EQ(S_OK, RunRegistryScript(kScript, kModule, RegistrationMode::Register));

    EXPECT_EQ(L"mine", ReadText(L"Software\\Shared", L"Ours"));
    EXPECT_EQ(L"C:\\x\\LVShellExt.dll", ReadText(L"Software\\Product", nullptr));
    EXPECT_EQ(L"F", ReadText(L"Software\\Forced", nullptr));
    EXPECT_TRUE(KeyExists(L"Software\\Forced\\Inner"));
    EXPECT_FALSE(KeyExists(L"Software\\Forced\\Stale")) << "ForceRemove starts from a clean key";

    UniqueRegKey sub;
    ASSERT_EQ(ERROR_SUCCESS, ::RegOpenKeyExW(HKEY_CURRENT_USER, L"Software\\Product\\Sub", 0,
                                             KEY_READ, sub.put()));
    DWORD count = 0;
    ASSERT_EQ(ERROR_SUCCESS, ReadDwordValue(sub.get(), L"Count", count));
    EXPECT_EQ(7u, count);
}

TEST(Registrar, UnregisterRemovesWhatTheScriptMadeAndKeepsWhatOthersOwn) {
    RegistryOverride registry;
    CreateKeyWithValue(L"Software\\Shared", L"Theirs", L"other");
    ASSERT_EQ(S_OK, RunRegistryScript(kScript, kModule, RegistrationMode::Register));
    CreateKeyWithValue(L"Software\\Forced\\Later", nullptr, nullptr);

    ASSERT_EQ(S_OK, RunRegistryScript(kScript, kModule, RegistrationMode::Unregister));
    EXPECT_TRUE(KeyExists(L"Software\\Shared")) << "NoRemove";
    EXPECT_FALSE(ValueExists(L"Software\\Shared", L"Ours"));
    EXPECT_EQ(L"other", ReadText(L"Software\\Shared", L"Theirs"));
    EXPECT_FALSE(KeyExists(L"Software\\Product"));
    EXPECT_FALSE(KeyExists(L"Software\\Forced")) << "ForceRemove takes foreign subkeys along";
    EXPECT_TRUE(KeyExists(L"Software"));

    // Nothing left to remove is not a failure.
    EXPECT_EQ(S_OK, RunRegistryScript(kScript, kModule, RegistrationMode::Unregister));
}

TEST(Registrar, UnregisterLeavesAPlainKeyThatStillHoldsForeignSubkeys) {
    RegistryOverride registry;
    ASSERT_EQ(S_OK, RunRegistryScript(kScript, kModule, RegistrationMode::Register));
    CreateKeyWithValue(L"Software\\Product\\Foreign", nullptr, nullptr);
    ASSERT_EQ(S_OK, RunRegistryScript(kScript, kModule, RegistrationMode::Unregister));
    EXPECT_TRUE(KeyExists(L"Software\\Product\\Foreign"));
    EXPECT_FALSE(KeyExists(L"Software\\Product\\Sub"));
}

TEST(Registrar, AMalformedScriptWritesNothing) {
    RegistryOverride registry;
    // Valid keys first, the error at the very end: nothing may be written before it is found.
    const wchar_t malformed[] =
        L"HKCU { NoRemove Software { First = s 'a' { val X = s 'b' } Second = d 'oops' } }";
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_INVALID_DATA),
              RunRegistryScript(malformed, kModule, RegistrationMode::Register));
    EXPECT_FALSE(KeyExists(L"Software\\First"));
}

TEST(Registrar, TheModuleCarriesAScriptForEveryResourceIdAndEachParses) {
    // The test executable carries the module's resources: every script must parse with the
    // module path in place. A malformed resource would make registration fail at install time.
    for (UINT id = 1; id <= 9; ++id) {
        const HRSRC found = ::FindResourceW(nullptr, MAKEINTRESOURCEW(id), L"REGISTRY");
        ASSERT_NE(nullptr, found) << id;
        const auto* bytes =
            static_cast<const uint8_t*>(::LockResource(::LoadResource(nullptr, found)));
        WideString text;
        ASSERT_TRUE(DecodeRegistryScriptBytes(bytes, ::SizeofResource(nullptr, found), text));
        std::vector<RegistryKeyOperation> operations;
        RegistryScriptError error;
        EXPECT_TRUE(ParseRegistryScript(text, kModule, operations, error))
            << "script " << id << " line " << error.line << ": " << error.message;
        EXPECT_FALSE(operations.empty());
    }
}
