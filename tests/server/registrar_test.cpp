// The registrar in both directions, on a scratch current-user hive.
#include <windows.h>

#include <gtest/gtest.h>

#include <optional>
#include <string>

#include "server/registrar.h"
#include "support/registry_value.h"
#include "tests/support/registry_override.h"

namespace {

bool KeyExists(const wchar_t* path) {
    UniqueRegKey key;
    return ::RegOpenKeyExW(HKEY_CURRENT_USER, path, 0, KEY_READ, key.put()) == ERROR_SUCCESS;
}

// A text value (the key's default value for a null name); none when the key or value is missing.
std::optional<std::wstring> Text(const wchar_t* path, const wchar_t* name = nullptr) {
    UniqueRegKey key;
    std::wstring text;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, path, 0, KEY_READ, key.put()) != ERROR_SUCCESS ||
        ReadStringValue(key.get(), name, 1024, text) != ERROR_SUCCESS)
        return std::nullopt;
    return text;
}

UniqueRegKey CreateKey(const wchar_t* path) {
    UniqueRegKey key;
    EXPECT_EQ(ERROR_SUCCESS, ::RegCreateKeyExW(HKEY_CURRENT_USER, path, 0, nullptr, 0,
                                               KEY_ALL_ACCESS, nullptr, key.put(), nullptr));
    return key;
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
    CreateKey(L"Software\\Forced\\Stale");
    ASSERT_EQ(S_OK, RunRegistryScript(kScript, kModule, RegistrationMode::Register));

    EXPECT_EQ(L"mine", Text(L"Software\\Shared", L"Ours"));
    EXPECT_EQ(L"C:\\x\\LVShellExt.dll", Text(L"Software\\Product"));
    EXPECT_EQ(L"F", Text(L"Software\\Forced"));
    EXPECT_TRUE(KeyExists(L"Software\\Forced\\Inner"));
    EXPECT_FALSE(KeyExists(L"Software\\Forced\\Stale")) << "ForceRemove starts from a clean key";

    DWORD count = 0;
    EXPECT_EQ(ERROR_SUCCESS,
              ReadDwordValue(CreateKey(L"Software\\Product\\Sub").get(), L"Count", count));
    EXPECT_EQ(7u, count);
}

TEST(Registrar, UnregisterRemovesWhatTheScriptMadeAndKeepsWhatOthersOwn) {
    RegistryOverride registry;
    ASSERT_EQ(ERROR_SUCCESS,
              WriteStringValue(CreateKey(L"Software\\Shared").get(), L"Theirs", L"other"));
    ASSERT_EQ(S_OK, RunRegistryScript(kScript, kModule, RegistrationMode::Register));
    CreateKey(L"Software\\Forced\\Later");

    ASSERT_EQ(S_OK, RunRegistryScript(kScript, kModule, RegistrationMode::Unregister));
    EXPECT_TRUE(KeyExists(L"Software\\Shared")) << "NoRemove";
    EXPECT_EQ(std::nullopt, Text(L"Software\\Shared", L"Ours"));
    EXPECT_EQ(L"other", Text(L"Software\\Shared", L"Theirs"));
    EXPECT_FALSE(KeyExists(L"Software\\Product"));
    EXPECT_FALSE(KeyExists(L"Software\\Forced")) << "ForceRemove takes foreign subkeys along";
    EXPECT_TRUE(KeyExists(L"Software"));

    // Nothing left to remove is not a failure.
    EXPECT_EQ(S_OK, RunRegistryScript(kScript, kModule, RegistrationMode::Unregister));

    // A plain key that still holds a foreign subkey stays, without the script's own.
    ASSERT_EQ(S_OK, RunRegistryScript(kScript, kModule, RegistrationMode::Register));
    CreateKey(L"Software\\Product\\Foreign");
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
