// Links to folders as any user makes them (mklink /D on Windows, ln -s on the host under Wine),
// for the walks over dropped folders; shared by the drop tests and the walk benchmark.
#pragma once

#include <windows.h>

#include <string>
#include <utility>
#include <vector>

#include "support/unique_resource.h"

// Under Wine, a host program run from a Windows process (the tests and benchmarks use the host's
// ln, rm and sh).
namespace wine_host {

inline bool UnderWine() {
    const HMODULE ntdll = ::GetModuleHandleW(L"ntdll.dll");
    return ntdll && ::GetProcAddress(ntdll, "wine_get_version");
}

// Runs a host program (as "/bin/ln") in folder under Wine, which starts a host binary that
// CreateProcessW is handed, and then waits until done() or the time is up. The host process has
// no handle here, so its effect is what is waited for.
template <typename Done>
bool RunHostProgram(const char* program, const std::wstring& arguments, const std::wstring& folder,
                    Done done, DWORD waitMilliseconds = 10000) {
    using DosFileName = WCHAR*(CDECL*)(const char*);
    const auto dosFileName = reinterpret_cast<DosFileName>(reinterpret_cast<void (*)()>(
        ::GetProcAddress(::GetModuleHandleW(L"kernel32.dll"), "wine_get_dos_file_name")));
    WCHAR* path = dosFileName ? dosFileName(program) : nullptr;
    if (!path)
        return false;
    std::wstring commandLine(program, program + std::char_traits<char>::length(program));
    commandLine += L" " + arguments;
    STARTUPINFOW startup{};
    startup.cb = sizeof(startup);
    PROCESS_INFORMATION process{};
    const BOOL started = ::CreateProcessW(path, commandLine.data(), nullptr, nullptr, FALSE, 0,
                                          nullptr, folder.c_str(), &startup, &process);
    ::HeapFree(::GetProcessHeap(), 0, path);
    UniqueHandle processHandle(process.hProcess), threadHandle(process.hThread);
    constexpr DWORD kPollMilliseconds = 10;
    for (DWORD waited = 0; started && waited < waitMilliseconds; waited += kPollMilliseconds) {
        if (done())
            return true;
        ::Sleep(kPollMilliseconds);
    }
    return false;
}

inline std::wstring HostText(std::wstring text) {
    for (wchar_t& c : text) {
        if (c == L'\\')
            c = L'/';
    }
    return L"\"" + text + L"\"";
}

}  // namespace wine_host

inline bool IsFolderLink(const std::wstring& path) {
    const DWORD attributes = ::GetFileAttributesW(path.c_str());
    constexpr DWORD kFolderLink = FILE_ATTRIBUTE_DIRECTORY | FILE_ATTRIBUTE_REPARSE_POINT;
    return attributes != INVALID_FILE_ATTRIBUTES && (attributes & kFolderLink) == kFolderLink;
}

// Folder links made for one test or run, removed again (the links only, never what they reach)
// when it ends, before the folder that holds them is deleted.
class ScopedDirectoryLinks {
public:
    ScopedDirectoryLinks() = default;
    ScopedDirectoryLinks(const ScopedDirectoryLinks&) = delete;
    ScopedDirectoryLinks& operator=(const ScopedDirectoryLinks&) = delete;
    ~ScopedDirectoryLinks() {
        for (auto made = links_.rbegin(); made != links_.rend(); ++made)
            Remove(made->first, made->second);
    }

    // Makes folder\name a link to target (relative to folder, as "." or "..\\other"); true once
    // it lists as a folder link. Wine's CreateSymbolicLinkW makes nothing and reports success:
    // there the host's ln makes the link.
    bool Make(const std::wstring& folder, const std::wstring& name, const std::wstring& target) {
        using namespace wine_host;
        const std::wstring link = folder + L"\\" + name;
        bool made = false;
        if (UnderWine()) {
            made = RunHostProgram("/bin/ln", L"-s " + HostText(target) + L" " + HostText(name),
                                  folder, [&] { return IsFolderLink(link); });
        } else {
            made = ::CreateSymbolicLinkW(link.c_str(), target.c_str(),
                                         SYMBOLIC_LINK_FLAG_DIRECTORY |
                                             SYMBOLIC_LINK_FLAG_ALLOW_UNPRIVILEGED_CREATE) &&
                   IsFolderLink(link);
        }
        if (made)
            links_.emplace_back(folder, name);
        return made;
    }

private:
    static void Remove(const std::wstring& folder, const std::wstring& name) {
        using namespace wine_host;
        const std::wstring link = folder + L"\\" + name;
        const auto gone = [&] {
            return ::GetFileAttributesW(link.c_str()) == INVALID_FILE_ATTRIBUTES;
        };
        if (::RemoveDirectoryW(link.c_str()) && gone())
            return;
        // Wine removes a directory with rmdir, which refuses a host link: the host's rm does it.
        if (UnderWine())
            (void)RunHostProgram("/bin/rm", L"-f " + HostText(name), folder, gone);
    }

    std::vector<std::pair<std::wstring, std::wstring>> links_;
};
