// lvregwxs: what DllRegisterServer of a built LVShellExt.dll writes, as a WiX include for the
// installer packages. It reads the registry scripts and the type library out of that DLL (x64 or
// x86, loaded as data only) and runs the scripts of the module's own class table through the
// module's own parser, so the package and self-registration cannot disagree.
#include <windows.h>
#include <oleauto.h>
#include <wrl/client.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include "server/class_table.h"
#include "server/lv_shell_folder.h"
#include "server/portable/installer_registry.h"
#include "server/registrar.h"
#include "server/registration.h"
#include "support/error_handling.h"
#include "support/unique_resource.h"

namespace {

const wchar_t kUsage[] =
    L"Usage: lvregwxs DLL FILE-ID INCLUDE TYPELIB-ROW\n"
    L"  Writes to INCLUDE the WiX include of the registry values that DllRegisterServer of DLL\n"
    L"  writes, with the DLL's path given as the installed file FILE-ID (\"[#FILE-ID]\"), and to\n"
    L"  TYPELIB-ROW its type library's row of the installer's TypeLib table (library, language,\n"
    L"  version, description; tab-separated).\n";

// Stands for the module's path while the scripts are parsed; never part of a real path.
const wchar_t kModulePlaceholder[] = L"\uE000MODULE\uE000";

int Fail(const std::wstring& what, HRESULT result) {
    std::fwprintf(stderr, L"lvregwxs: %ls (0x%08lX)\n", what.c_str(),
                  static_cast<unsigned long>(result));
    return 1;
}

std::wstring GuidText(REFGUID guid) {
    wchar_t text[40] = {};
    (void)::StringFromGUID2(guid, text, ARRAYSIZE(text));  // 40 characters always suffice
    return text;
}

// The type library's row of the installer's TypeLib table (library, language, version,
// description), tab-separated: the installer registers the library with the system's own
// RegisterTypeLib, as self-registration does, so the keys it writes (HELPDIR among them, which
// no formatted text of an installer can express without a trailing backslash) are the same.
[[nodiscard]] HRESULT TypeLibraryRow(const std::wstring& path, std::string& row) noexcept {
    try {
        Microsoft::WRL::ComPtr<ITypeLib> library;
        HRESULT result = ::LoadTypeLibEx(path.c_str(), REGKIND_NONE, &library);
        if (FAILED(result))
            return result;
        TLIBATTR* attributes = nullptr;
        result = library->GetLibAttr(&attributes);
        if (FAILED(result))
            return result;
        const TLIBATTR copy = *attributes;
        library->ReleaseTLibAttr(attributes);
        BSTR name = nullptr;
        BSTR documentation = nullptr;
        result = library->GetDocumentation(-1, &name, &documentation, nullptr, nullptr);
        if (FAILED(result))
            return result;
        const std::wstring title = documentation ? documentation : (name ? name : L"");
        ::SysFreeString(name);
        ::SysFreeString(documentation);
        // The table keeps the major version above the minor one's eight bits.
        const std::wstring text = GuidText(copy.guid) + L"\t" + std::to_wstring(copy.lcid) + L"\t" +
                                  std::to_wstring((copy.wMajorVerNum << 8) | copy.wMinorVerNum) +
                                  L"\t" + title + L"\n";
        row.assign(text.begin(), text.end());  // identifiers, numbers and an ASCII title
        return S_OK;
    }
    CATCH_RETURN()
}

int Write(const std::wstring& path, const std::wstring& fileId, const std::wstring& output,
          const std::wstring& typeLibraryOutput) {
    // As data: the x86 module can be read from this x64 program, and none of its code runs.
    UniqueHModule module(::LoadLibraryExW(
        path.c_str(), nullptr, LOAD_LIBRARY_AS_DATAFILE | LOAD_LIBRARY_AS_IMAGE_RESOURCE));
    if (!module)
        return Fail(L"cannot read " + path, HRESULT_FROM_WIN32(::GetLastError()));

    std::vector<RegistryKeyOperation> operations;
    for (const ClassTableEntry& entry : ClassTable()) {
        std::vector<RegistryKeyOperation> script;
        const HRESULT result =
            ParseRegistryResource(module.get(), entry.registryScriptId, kModulePlaceholder, script);
        if (FAILED(result))
            return Fail(L"registry script " + std::to_wstring(entry.registryScriptId), result);
        operations.insert(operations.end(), script.begin(), script.end());
    }
    std::vector<InstallerRegistryValue> values;
    AppendInstallerValues(operations, values);

    // The folder's ShellFolder attributes, written by code after the scripts, as REG_BINARY, into
    // the key the script made: its spelling is the one the registry keeps.
    InstallerRegistryValue attributes;
    attributes.key = L"CLSID\\" + GuidText(CLSID_LVShellFolder) + L"\\ShellFolder";
    for (const RegistryKeyOperation& key : operations) {
        if (SameRegistryKey(key.root, key.path, attributes.root, attributes.key))
            attributes.key = key.path;
    }
    attributes.name = L"Attributes";
    attributes.type = InstallerValueType::Binary;
    attributes.bytes.assign(std::begin(kShellFolderAttributes), std::end(kShellFolderAttributes));
    values.push_back(attributes);

    const WideString empty = FindKeyLeftEmpty(operations, values);
    if (!empty.empty())
        return Fail(L"the key " + empty + L" would be created empty", E_FAIL);
    std::string row;
    const HRESULT result = TypeLibraryRow(path, row);
    if (FAILED(result))
        return Fail(L"the type library of " + path, result);

    std::string error;
    const std::string id(fileId.begin(), fileId.end());  // an installer identifier is ASCII
    const std::string reference = "[#" + id + "]";
    std::string include;
    if (!WriteWixRegistryInclude(values, kModulePlaceholder, reference, id,
                                 "Generated by lvregwxs from the module's registry scripts and "
                                 "type library: what its DllRegisterServer writes. Do not edit.",
                                 include, error))
        return Fail(std::wstring(error.begin(), error.end()), E_FAIL);
    std::ofstream file(std::filesystem::path(output), std::ios::binary);
    file << include;
    std::ofstream rowFile(std::filesystem::path(typeLibraryOutput), std::ios::binary);
    rowFile << row;
    return file.good() && rowFile.good() ? 0 : Fail(L"cannot write the output", E_FAIL);
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
    if (argc != 5 || argv[1] == std::wstring(L"--help")) {
        std::fputws(kUsage, argc == 2 ? stdout : stderr);
        return argc == 2 ? 0 : 2;
    }
    return Write(argv[1], argv[2], argv[3], argv[4]);
}
