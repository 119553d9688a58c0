// Times a drop on a station (CLVDropTarget::Drop, the shell's own data object for one folder)
// over a folder with links back to itself and over folders of many files, empty subfolders and
// shortcuts, and prints what each drop found, the drop's result, the error-log entries of the
// drops (one per drop that a limit stopped) and the times.
#include <windows.h>
#include <objbase.h>
#include <ole2.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <functional>
#include <string>
#include <vector>

#include "namespace/pidl_manager.h"
#include "support/error_log.h"
#include "support/unique_resource.h"
#include "tests/drop/directory_link.h"
#include "view/lv_drop_target.h"

using Microsoft::WRL::ComPtr;

namespace {

using Clock = std::chrono::steady_clock;
constexpr int kRepetitions = 5;

// A folder under the temporary folder, deleted (with everything in it) at the end.
class ScratchFolder {
public:
    ScratchFolder() {
        wchar_t temporary[MAX_PATH] = {};
        ::GetTempPathW(MAX_PATH, temporary);
        path_ = std::wstring(temporary) + L"lvdropbench" + std::to_wstring(::GetTickCount64());
        ::CreateDirectoryW(path_.c_str(), nullptr);
    }
    ~ScratchFolder() {
        std::wstring from = path_ + L'\0';
        SHFILEOPSTRUCTW remove{};
        remove.wFunc = FO_DELETE;
        remove.pFrom = from.c_str();
        remove.fFlags = FOF_NO_UI;
        ::SHFileOperationW(&remove);
    }
    const std::wstring& Path() const { return path_; }

private:
    std::wstring path_;
};

bool MakeFile(const std::wstring& path) {
    return static_cast<bool>(UniqueFileHandle(::CreateFileW(
        path.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr)));
}

bool MakeShortcut(const std::wstring& path, const std::wstring& target) {
    ComPtr<IShellLinkW> link;
    ComPtr<IPersistFile> file;
    return SUCCEEDED(::CoCreateInstance(CLSID_ShellLink, nullptr, CLSCTX_INPROC_SERVER,
                                        IID_PPV_ARGS(&link))) &&
           SUCCEEDED(link->SetPath(target.c_str())) && SUCCEEDED(link.As(&file)) &&
           SUCCEEDED(file->Save(path.c_str(), TRUE));
}

// What the shell hands a drop target for one folder dragged from its parent.
ComPtr<IDataObject> ShellDataObject(const std::wstring& path) {
    PIDLIST_ABSOLUTE raw = nullptr;
    if (FAILED(::SHParseDisplayName(path.c_str(), nullptr, &raw, 0, nullptr)))
        return nullptr;
    UniqueAbsoluteIdList item(raw);
    ComPtr<IShellFolder> parent;
    PCUITEMID_CHILD child = nullptr;
    ComPtr<IDataObject> data;
    if (SUCCEEDED(::SHBindToParent(item.get(), IID_PPV_ARGS(&parent), &child)))
        (void)parent->GetUIObjectOf(nullptr, 1, &child, IID_IDataObject, nullptr,
                                    reinterpret_cast<void**>(data.GetAddressOf()));
    return data;
}

// Entries the parser has written to the error log so far.
size_t LogEntries() {
    UniqueFileHandle file(::CreateFileW(ErrorLogPath().c_str(), GENERIC_READ,
                                        FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr, OPEN_EXISTING,
                                        0, nullptr));
    if (!file)
        return 0;
    std::wstring text(::GetFileSize(file.get(), nullptr) / sizeof(wchar_t), L'\0');
    DWORD read = 0;
    ::ReadFile(file.get(), text.data(), static_cast<DWORD>(text.size() * sizeof(wchar_t)), &read,
               nullptr);
    size_t count = 0;
    for (size_t at = text.find(L"SourceParser - 0x"); at != std::wstring::npos;
         at = text.find(L"SourceParser - 0x", at + 1))
        ++count;
    return count;
}

struct Scenario {
    const char* name;
    std::function<bool(const std::wstring& folder, ScopedDirectoryLinks& links)> make;
};

// Removes a case's folder once measured (its links are gone by then). Under Wine the host does it,
// for the same reason as it makes the entries.
void RemoveFolder(const std::wstring& parent, const std::wstring& name) {
    const std::wstring folder = parent + L"\\" + name;
    if (wine_host::UnderWine()) {
        constexpr DWORD kRemoveMilliseconds = 300000;
        (void)wine_host::RunHostProgram(
            "/bin/rm", L"-rf " + wine_host::HostText(name), parent,
            [&] { return ::GetFileAttributesW(folder.c_str()) == INVALID_FILE_ATTRIBUTES; },
            kRemoveMilliseconds);
        return;
    }
    std::wstring from = folder + L'\0';
    SHFILEOPSTRUCTW remove{};
    remove.wFunc = FO_DELETE;
    remove.pFrom = from.c_str();
    remove.fFlags = FOF_NO_UI;
    ::SHFileOperationW(&remove);
}

void MeasureIn(const std::wstring& folder, const Scenario& scenario) {
    ::CreateDirectoryW(folder.c_str(), nullptr);
    ScopedDirectoryLinks links;
    const Clock::time_point makeStart = Clock::now();
    if (!scenario.make(folder, links)) {
        std::printf("%-48s could not be made\n", scenario.name);
        return;
    }
    const double makeSeconds = std::chrono::duration<double>(Clock::now() - makeStart).count();
    ComPtr<IDataObject> data = ShellDataObject(folder);
    CPidlMgr manager;
    UniqueRelativePidl station = manager.CreatePidlFromPath(L"Quorvel Digital Level\\Bench");
    if (!data || !station) {
        std::printf("%-48s no data object\n", scenario.name);
        return;
    }
    std::vector<double> milliseconds;
    size_t found = 0;
    HRESULT result = S_OK;
    const size_t logBefore = LogEntries();
    for (int run = 0; run < kRepetitions; ++run) {
        auto target = MakeComObject<CLVDropTarget>();
        (void)target->SetItem(station.get());
        (void)target->SetReceiver(
            [&](const std::wstring&, const std::shared_ptr<TSourceList>& sources) {
                found = sources->size();
            });
        DWORD effect = DROPEFFECT_COPY;
        const Clock::time_point start = Clock::now();
        result = target->Drop(data.Get(), 0, {}, &effect);
        milliseconds.push_back(
            std::chrono::duration<double, std::milli>(Clock::now() - start).count());
    }
    std::sort(milliseconds.begin(), milliseconds.end());
    std::printf("%-46s %8zu %#7lx %5zu %9.1f %9.1f %9.1f %7.1f\n", scenario.name, found,
                static_cast<unsigned long>(result), LogEntries() - logBefore, milliseconds.front(),
                milliseconds[milliseconds.size() / 2], milliseconds.back(), makeSeconds);
    std::fflush(stdout);
}

void Measure(const ScratchFolder& scratch, int number, const Scenario& scenario) {
    const std::wstring name = L"case" + std::to_wstring(number);
    MeasureIn(scratch.Path() + L"\\" + name, scenario);
    RemoveFolder(scratch.Path(), name);
}

// count files ("f1.lv", …) or empty subfolders ("d1", …) in folder. Under Wine the host makes
// them: Wine looks through a folder for a name in every case before it creates one, so making
// 100,000 entries one by one through it takes far longer than the walk over them.
bool MakeEntries(const std::wstring& folder, int count, bool subfolders) {
    if (wine_host::UnderWine()) {
        const std::wstring made = folder + L".made";
        const std::wstring script = L"seq -f " + std::wstring(subfolders ? L"d%.0f" : L"f%.0f.lv") +
                                    L" 1 " + std::to_wstring(count) + L" | xargs " +
                                    (subfolders ? L"mkdir" : L"touch") + L" && touch ../" +
                                    folder.substr(folder.find_last_of(L'\\') + 1) + L".made";
        constexpr DWORD kMakeMilliseconds = 300000;
        return wine_host::RunHostProgram(
            "/bin/sh", L"-c \"" + script + L"\"", folder,
            [&] { return ::GetFileAttributesW(made.c_str()) != INVALID_FILE_ATTRIBUTES; },
            kMakeMilliseconds);
    }
    for (int entry = 1; entry <= count; ++entry) {
        const std::wstring number = std::to_wstring(entry);
        if (subfolders ? !::CreateDirectoryW((folder + L"\\d" + number).c_str(), nullptr)
                       : !MakeFile(folder + L"\\f" + number + L".lv"))
            return false;
    }
    return true;
}

Scenario Files(const char* name, int count) {
    return {name, [count](const std::wstring& folder, ScopedDirectoryLinks&) {
                return MakeEntries(folder, count, false);
            }};
}

Scenario Subfolders(const char* name, int count) {
    return {name, [count](const std::wstring& folder, ScopedDirectoryLinks&) {
                return MakeEntries(folder, count, true);
            }};
}

Scenario Shortcuts(const char* name, int count) {
    return {
        name, [count](const std::wstring& folder, ScopedDirectoryLinks&) {
            const std::wstring target = folder + L"\\target.lv";
            if (!MakeFile(target))
                return false;
            for (int shortcut = 0; shortcut < count; ++shortcut) {
                if (!MakeShortcut(folder + L"\\s" + std::to_wstring(shortcut) + L".lnk", target))
                    return false;
            }
            return true;
        }};
}

// Three files, two links back to the folder and one from a subfolder to its parent: each level
// of a walk that followed links by path would list three new folders, down to the depth limit.
Scenario Looped() {
    return {"looped folder: 3 files, 3 links back",
            [](const std::wstring& folder, ScopedDirectoryLinks& links) {
                const std::wstring sub = folder + L"\\sub";
                return ::CreateDirectoryW(sub.c_str(), nullptr) && MakeFile(folder + L"\\a.lv") &&
                       MakeFile(folder + L"\\b.lv") && MakeFile(sub + L"\\c.lv") &&
                       links.Make(folder, L"first", L".") && links.Make(folder, L"second", L".") &&
                       links.Make(sub, L"up", L"..");
            }};
}

}  // namespace

int main() {
    if (FAILED(::OleInitialize(nullptr)))
        return 1;
    {
        ScratchFolder scratch;
        // The one entry a drop stopped at its limit writes goes to the scratch folder.
        const std::wstring log = scratch.Path() + L"\\log";
        ::CreateDirectoryW(log.c_str(), nullptr);
        ::SetEnvironmentVariableW(L"LVSHELLEXT_LOG_DIR", log.c_str());
        std::printf("drop on a station, %d drops each; entry limit %u, time limit %lu ms\n",
                    kRepetitions, kDefaultSourceEntryLimit,
                    static_cast<unsigned long>(kDefaultSourceWalkMilliseconds));
        std::printf("%-46s %8s %7s %5s %9s %9s %9s %7s\n", "folder", "sources", "result", "log",
                    "min ms", "median ms", "max ms", "make s");
        const Scenario scenarios[] = {
            Looped(),
            Files("plain folder: 1,000 files", 1000),
            Files("plain folder: 10,000 files", 10000),
            Files("plain folder: 99,999 files", 99999),
            Files("plain folder: 150,000 files (past the limit)", 150000),
            Subfolders("10,000 empty subfolders", 10000),
            Subfolders("100,000 empty subfolders (at the limit)", 99999),
            Shortcuts("1,000 shortcuts to one file", 1000),
        };
        int number = 0;
        for (const Scenario& scenario : scenarios)
            Measure(scratch, ++number, scenario);
        std::fflush(stdout);
    }
    ::OleUninitialize();
    return 0;
}
