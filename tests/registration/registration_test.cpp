// Self-registration through the system's own regsvr32, checked key by key in the registry.
// Registration writes HKEY_CLASSES_ROOT (under Wine: HKLM\Software\Classes only) and
// HKEY_LOCAL_MACHINE of the private prefix; each test registers and unregisters for itself.
#include <windows.h>
#include <process.h>

#include <gtest/gtest.h>

#include <cwchar>
#include <set>
#include <string>
#include <vector>

#include "tests/server/extension_module.h"

namespace {

const std::wstring kFolderKey = L"CLSID\\{7D3F2A61-4B8E-4C19-9A27-5E0C81B6D4F3}";
const std::wstring kTypeLib = L"{B8D31C5F-2A67-4E9B-A4F1-5C09D7E82B36}";
const std::wstring kApprovedKey =
    L"Software\\Microsoft\\Windows\\CurrentVersion\\Shell Extensions\\Approved";
// The folder's value there, as a dumped line starts.
const std::wstring kApprovedValue = L"|{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}|";
const std::wstring kNameSpaceKey =
    L"Software\\Microsoft\\Windows\\CurrentVersion\\Explorer\\MyComputer\\NameSpace\\"
    L"{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}";

const struct ScriptedClass {
    const wchar_t* classId;
    const wchar_t* progId;
    const wchar_t* description;
} kScriptedClasses[] = {
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

using RegistryLines = std::set<std::wstring>;

// A registry subtree as comparable lines: "path|" for every key (so that empty keys show) and
// "path|value name|data" for every value, with texts as they are and binary data as hex bytes.
// Paths are relative to the dumped key, whose own is "".
void DumpRegistryTree(HKEY parent, const std::wstring& subkey, const std::wstring& relative,
                      RegistryLines& lines) {
    UniqueRegKey key;
    if (::RegOpenKeyExW(parent, subkey.c_str(), 0, KEY_READ, key.put()) != ERROR_SUCCESS)
        return;
    lines.insert(relative + L"|");
    wchar_t name[16384];
    for (DWORD index = 0;; ++index) {
        DWORD nameLength = ARRAYSIZE(name), type = 0;
        BYTE data[4096];
        DWORD size = sizeof data;
        if (::RegEnumValueW(key.get(), index, name, &nameLength, nullptr, &type, data, &size) !=
            ERROR_SUCCESS)
            break;
        std::wstring text;
        if (type == REG_SZ) {
            text.assign(reinterpret_cast<const wchar_t*>(data), size / sizeof(wchar_t));
            text.erase(text.find_last_not_of(L'\0') + 1);
        } else {
            text = type == REG_BINARY ? L"REG_BINARY" : L"type " + std::to_wstring(type);
            for (DWORD byte = 0; byte < size; ++byte) {
                wchar_t hex[4];
                swprintf(hex, ARRAYSIZE(hex), L" %02X", data[byte]);
                text += hex;
            }
        }
        lines.insert(relative + L"|" + std::wstring(name, nameLength) + L"|" + text);
    }
    for (DWORD index = 0;; ++index) {
        DWORD nameLength = ARRAYSIZE(name);
        if (::RegEnumKeyExW(key.get(), index, name, &nameLength, nullptr, nullptr, nullptr,
                            nullptr) != ERROR_SUCCESS)
            break;
        const std::wstring child(name, nameLength);
        DumpRegistryTree(key.get(), child, relative.empty() ? child : relative + L"\\" + child,
                         lines);
    }
}

RegistryLines Dump(HKEY root, const std::wstring& path) {
    RegistryLines lines;
    DumpRegistryTree(root, path, L"", lines);
    return lines;
}

// Runs the system's regsvr32 silently and returns its exit code (-1 when it cannot start).
intptr_t RunRegsvr32(bool unregister) {
    wchar_t system[MAX_PATH];
    ::GetSystemDirectoryW(system, MAX_PATH);
    const std::wstring program = std::wstring(system) + L"\\regsvr32.exe";
    // The arguments are joined with spaces into one command line: the path is quoted.
    const std::wstring module = L"\"" + ExtensionDllPath() + L"\"";
    std::vector<const wchar_t*> arguments = {L"regsvr32.exe", L"/s"};
    if (unregister)
        arguments.push_back(L"/u");
    arguments.insert(arguments.end(), {module.c_str(), nullptr});
    return ::_wspawnv(_P_WAIT, program.c_str(), arguments.data());
}

class Registration : public testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(0, RunRegsvr32(false)); }
    void TearDown() override { EXPECT_EQ(0, RunRegsvr32(true)); }
};

}  // namespace

TEST_F(Registration, TheFolderClassKeyHoldsExactlyItsValuesAndTheFolderIsApprovedUnderMyComputer) {
    const std::wstring module = ExtensionDllPath();
    const RegistryLines expected = {
        L"|",
        L"||Quorvel Digital Levels",
        L"|InfoTip|Allows you to read files from Quorvel Digital Level",
        L"DefaultIcon|",
        L"DefaultIcon||" + module + L",0",
        L"InprocServer32|",
        L"InprocServer32||" + module,
        L"InprocServer32|ThreadingModel|Apartment",
        L"TypeLib|",
        L"TypeLib||" + kTypeLib,
        L"ShellFolder|",
        L"ShellFolder|Attributes|REG_BINARY 00 00 00 A0",
    };
    EXPECT_EQ(expected, Dump(HKEY_CLASSES_ROOT, kFolderKey));
    EXPECT_EQ(
        1u,
        Dump(HKEY_LOCAL_MACHINE, kApprovedKey).count(kApprovedValue + L"Quorvel Digital Levels"));
    EXPECT_EQ((RegistryLines{L"|", L"||Quorvel Digital Levels"}),
              Dump(HKEY_LOCAL_MACHINE, kNameSpaceKey));
    EXPECT_EQ(1u, Dump(HKEY_CLASSES_ROOT, L"TypeLib\\" + kTypeLib + L"\\1.0\\0\\win64")
                      .count(L"||" + module));
}

TEST_F(Registration, EveryScriptedClassHasItsProgIdsAndClassKey) {
    const std::wstring module = ExtensionDllPath();
    for (const ScriptedClass& item : kScriptedClasses) {
        const std::wstring progId = item.progId, versioned = progId + L".1";
        const std::wstring description = item.description, classId = item.classId;
        EXPECT_EQ((RegistryLines{L"|", L"||" + description, L"CLSID|", L"CLSID||" + classId}),
                  Dump(HKEY_CLASSES_ROOT, versioned));
        EXPECT_EQ((RegistryLines{L"|", L"||" + description, L"CLSID|", L"CLSID||" + classId,
                                 L"CurVer|", L"CurVer||" + versioned}),
                  Dump(HKEY_CLASSES_ROOT, progId));
        EXPECT_EQ(
            (RegistryLines{L"|", L"||" + description, L"ProgID|", L"ProgID||" + versioned,
                           L"VersionIndependentProgID|", L"VersionIndependentProgID||" + progId,
                           L"InprocServer32|", L"InprocServer32||" + module,
                           L"InprocServer32|ThreadingModel|Apartment", L"TypeLib|",
                           L"TypeLib||" + kTypeLib}),
            Dump(HKEY_CLASSES_ROOT, L"CLSID\\" + classId));
    }
    EXPECT_EQ(RegistryLines{},
              Dump(HKEY_CLASSES_ROOT, L"CLSID\\{1C6E9B4A-F5D2-4B73-8E29-A03F6C7D51E4}"))
        << "the context-menu script is carried but never run";
}

// The second unregistration finds nothing left to remove, which is no failure.
TEST_F(Registration, UnregisterRemovesEverythingButAnEmptyShellFolderKey) {
    ASSERT_EQ(0, RunRegsvr32(true));
    ASSERT_EQ(0, RunRegsvr32(true));
    EXPECT_EQ((RegistryLines{L"|", L"ShellFolder|"}), Dump(HKEY_CLASSES_ROOT, kFolderKey));
    for (const ScriptedClass& item : kScriptedClasses) {
        for (const std::wstring& key :
             {std::wstring(item.progId), std::wstring(item.progId) + L".1",
              std::wstring(L"CLSID\\") + item.classId}) {
            EXPECT_EQ(RegistryLines{}, Dump(HKEY_CLASSES_ROOT, key)) << key;
        }
    }
    const RegistryLines approved = Dump(HKEY_LOCAL_MACHINE, kApprovedKey);
    EXPECT_EQ(1u, approved.count(L"|")) << "NoRemove";
    for (const std::wstring& line : approved)
        EXPECT_FALSE(line.starts_with(kApprovedValue)) << line;
    EXPECT_EQ(RegistryLines{}, Dump(HKEY_LOCAL_MACHINE, kNameSpaceKey));
    EXPECT_EQ(RegistryLines{}, Dump(HKEY_CLASSES_ROOT, L"TypeLib\\" + kTypeLib));
}
