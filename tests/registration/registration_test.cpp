// Self-registration through the system's own regsvr32, checked key by key in the registry.
// Registration writes HKEY_CLASSES_ROOT (under Wine: HKLM\Software\Classes only) and
// HKEY_LOCAL_MACHINE of the private prefix; each test registers and unregisters for itself.
#include <windows.h>

#include <gtest/gtest.h>

#include <string>

#include "tests/registration/registry_dump.h"
#include "tests/server/extension_module.h"

namespace {

const std::wstring kFolderKey = L"CLSID\\{7D3F2A61-4B8E-4C19-9A27-5E0C81B6D4F3}";
const std::wstring kTypeLib = L"{B8D31C5F-2A67-4E9B-A4F1-5C09D7E82B36}";
const std::wstring kApprovedKey =
    L"Software\\Microsoft\\Windows\\CurrentVersion\\Shell Extensions\\Approved";
const std::wstring kNameSpaceKey =
    L"Software\\Microsoft\\Windows\\CurrentVersion\\Explorer\\MyComputer\\NameSpace\\"
    L"{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}";

struct ScriptedClass {
    const wchar_t* classId;
    const wchar_t* progId;
    const wchar_t* description;
};

const ScriptedClass kScriptedClasses[] = {
    {L"{4F9A7D26-E3B1-4C58-8D0F-72A5B1E6C390}", L"LVShellExt.LVDataObject", L"LVDataObject Class"},
    {L"{3B8C1F92-A6D5-4E07-9C4B-D21F7A8E3065}", L"LVShellExt.LVEnumIDList", L"LVEnumIDList Class"},
    {L"{9E2B6D14-7C3A-4F85-B1D9-36A8E05C7F21}", L"LVShellExt.LVExtractIcon",
     L"LVExtractIcon Class"},
    {L"{5A91C3E7-2F04-4B6D-8E13-A7C2D90F4B58}", L"AZShellExt.AZQueryInfo", L"AZQueryInfo Class"},
    {L"{A2C54E87-6B19-4D3A-9F72-18E6C0B5A94D}", L"LVShellExt.LVShellView", L"LVShellView Class"},
    {L"{61F7B2C9-8D3E-4A14-A5C0-E9274B6D8F13}", L"LVShellExt.LVDropTarget", L"LVDropTarget Class"},
    {L"{D46E8A3B-1C92-4A5F-87E6-0B3D9F52C1A8}", L"LVShellExt.LVDropTargetOnListView",
     L"LVDropTargetOnListView Class"},
};

const wchar_t kContextMenuKey[] = L"CLSID\\{1C6E9B4A-F5D2-4B73-8E29-A03F6C7D51E4}";

// Runs the system's regsvr32 silently and returns its exit code.
DWORD RunRegsvr32(bool unregister) {
    wchar_t system[MAX_PATH];
    ::GetSystemDirectoryW(system, MAX_PATH);
    const std::wstring program = std::wstring(system) + L"\\regsvr32.exe";
    std::wstring commandLine = L"regsvr32.exe /s ";
    if (unregister)
        commandLine += L"/u ";
    commandLine += L"\"" + ExtensionDllPath() + L"\"";
    STARTUPINFOW startup{};
    startup.cb = sizeof startup;
    PROCESS_INFORMATION process{};
    if (!::CreateProcessW(program.c_str(), commandLine.data(), nullptr, nullptr, FALSE, 0, nullptr,
                          nullptr, &startup, &process))
        return ::GetLastError() | 0x80000000u;
    UniqueHandle processHandle(process.hProcess), thread(process.hThread);
    ::WaitForSingleObject(processHandle.get(), 60000);
    DWORD exitCode = 0xFFFFFFFF;
    ::GetExitCodeProcess(processHandle.get(), &exitCode);
    return exitCode;
}

bool KeyExists(HKEY root, const std::wstring& path) {
    UniqueRegKey key;
    return ::RegOpenKeyExW(root, path.c_str(), 0, KEY_READ, key.put()) == ERROR_SUCCESS;
}

std::wstring ApprovedValue() {
    const RegistryLines lines = DumpRegistryTree(HKEY_LOCAL_MACHINE, kApprovedKey);
    const std::wstring prefix = L"|{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}|";
    for (const std::wstring& line : lines) {
        if (line.compare(0, prefix.size(), prefix) == 0)
            return line.substr(prefix.size());
    }
    return {};
}

class Registration : public testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(0u, RunRegsvr32(false)); }
    void TearDown() override { EXPECT_EQ(0u, RunRegsvr32(true)); }
};

}  // namespace

TEST_F(Registration, TheFolderClassKeyHoldsExactlyItsValuesAndTheBinaryAttributes) {
    const std::wstring module = ExtensionDllPath();
    const RegistryLines expected = {
        L"|",
        L"||REG_SZ|Quorvel Digital Levels",
        L"|InfoTip|REG_SZ|Allows you to read files from Quorvel Digital Level",
        L"DefaultIcon|",
        L"DefaultIcon||REG_SZ|" + module + L",0",
        L"InprocServer32|",
        L"InprocServer32||REG_SZ|" + module,
        L"InprocServer32|ThreadingModel|REG_SZ|Apartment",
        L"TypeLib|",
        L"TypeLib||REG_SZ|" + kTypeLib,
        L"ShellFolder|",
        L"ShellFolder|Attributes|REG_BINARY|00 00 00 A0",
    };
    EXPECT_EQ(expected, DumpRegistryTree(HKEY_CLASSES_ROOT, kFolderKey));
}

TEST_F(Registration, EveryScriptedClassHasItsProgIdsAndClassKey) {
    const std::wstring module = ExtensionDllPath();
    for (const ScriptedClass& item : kScriptedClasses) {
        const std::wstring progId = item.progId, versioned = progId + L".1";
        const std::wstring description = item.description, classId = item.classId;
        EXPECT_EQ((RegistryLines{L"|", L"||REG_SZ|" + description, L"CLSID|",
                                 L"CLSID||REG_SZ|" + classId}),
                  DumpRegistryTree(HKEY_CLASSES_ROOT, versioned));
        EXPECT_EQ(
            (RegistryLines{L"|", L"||REG_SZ|" + description, L"CLSID|", L"CLSID||REG_SZ|" + classId,
                           L"CurVer|", L"CurVer||REG_SZ|" + versioned}),
            DumpRegistryTree(HKEY_CLASSES_ROOT, progId));
        EXPECT_EQ((RegistryLines{L"|", L"||REG_SZ|" + description, L"ProgID|",
                                 L"ProgID||REG_SZ|" + versioned, L"VersionIndependentProgID|",
                                 L"VersionIndependentProgID||REG_SZ|" + progId, L"InprocServer32|",
                                 L"InprocServer32||REG_SZ|" + module,
                                 L"InprocServer32|ThreadingModel|REG_SZ|Apartment", L"TypeLib|",
                                 L"TypeLib||REG_SZ|" + kTypeLib}),
                  DumpRegistryTree(HKEY_CLASSES_ROOT, L"CLSID\\" + classId));
    }
    EXPECT_FALSE(KeyExists(HKEY_CLASSES_ROOT, kContextMenuKey))
        << "the context-menu script is carried but never run";
}

TEST_F(Registration, TheFolderIsApprovedAndStandsUnderMyComputer) {
    EXPECT_EQ(L"REG_SZ|Quorvel Digital Levels", ApprovedValue());
    EXPECT_EQ((RegistryLines{L"|", L"||REG_SZ|Quorvel Digital Levels"}),
              DumpRegistryTree(HKEY_LOCAL_MACHINE, kNameSpaceKey));
    const RegistryLines typeLibrary =
        DumpRegistryTree(HKEY_CLASSES_ROOT, L"TypeLib\\" + kTypeLib + L"\\1.0\\0\\win64");
    EXPECT_EQ(1u, typeLibrary.count(L"||REG_SZ|" + ExtensionDllPath()));
}

TEST_F(Registration, UnregisterRemovesEverythingButAnEmptyShellFolderKey) {
    ASSERT_EQ(0u, RunRegsvr32(true));

    EXPECT_EQ((RegistryLines{L"|", L"ShellFolder|"}),
              DumpRegistryTree(HKEY_CLASSES_ROOT, kFolderKey));
    for (const ScriptedClass& item : kScriptedClasses) {
        EXPECT_FALSE(KeyExists(HKEY_CLASSES_ROOT, item.progId)) << item.progId;
        EXPECT_FALSE(KeyExists(HKEY_CLASSES_ROOT, std::wstring(item.progId) + L".1"));
        EXPECT_FALSE(KeyExists(HKEY_CLASSES_ROOT, std::wstring(L"CLSID\\") + item.classId));
    }
    EXPECT_EQ(L"", ApprovedValue());
    EXPECT_TRUE(KeyExists(HKEY_LOCAL_MACHINE, kApprovedKey)) << "NoRemove";
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, kNameSpaceKey));
    EXPECT_FALSE(KeyExists(HKEY_CLASSES_ROOT, L"TypeLib\\" + kTypeLib));
}

TEST(Unregistration, SucceedsWhenNothingIsRegistered) {
    ExtensionModule module;
    EXPECT_EQ(S_OK, module.Unregister());
    EXPECT_EQ(S_OK, module.Unregister());
    EXPECT_EQ((RegistryLines{L"|", L"ShellFolder|"}),
              DumpRegistryTree(HKEY_CLASSES_ROOT, kFolderKey));
}
