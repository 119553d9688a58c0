// lvexplore: opens a folder's own view in a browser window with the menu bar, toolbar and status
// bar that Wine's browsers do not give a hosted view; by default "Quorvel Digital Levels".
#include <windows.h>
#include <commctrl.h>
#include <ole2.h>

#include <cstdio>
#include <string>

#include "tools/common/console_output.h"
#include "tools/lvexplore/explorer_window.h"

using Microsoft::WRL::ComPtr;

namespace {

const wchar_t kDefaultFolder[] =
    L"::{20D04FE0-3AEA-1069-A2D8-08002B30309D}\\::{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}";
const wchar_t kDefaultFolderName[] = L"My Computer\\Quorvel Digital Levels";

const wchar_t kUsage[] =
    L"Usage:\n"
    L"  lvexplore [PARSING-NAME] [--view large|small|list|details] [--trace]\n"
    L"\n"
    L"Opens the folder in a browser window as Explorer shows it: the folder's own view, its\n"
    L"merged menus and its status text. Without a name: My Computer\\Quorvel Digital Levels.\n"
    L"  --view    the view mode of the first folder (default: large)\n"
    L"  --trace   prints each call the view makes on the browser\n"
    L"Keys: Alt+Left goes back, Backspace goes up, F5 refreshes.\n";

struct Arguments {
    std::wstring folder = kDefaultFolder;
    UINT viewMode = FVM_ICON;
    bool trace = false;
    bool help = false;
};

bool ParseViewMode(const std::wstring& name, UINT& mode) {
    static const struct {
        const wchar_t* name;
        UINT mode;
    } modes[] = {{L"large", FVM_ICON},
                 {L"small", FVM_SMALLICON},
                 {L"list", FVM_LIST},
                 {L"details", FVM_DETAILS}};
    for (const auto& entry : modes) {
        if (name == entry.name) {
            mode = entry.mode;
            return true;
        }
    }
    return false;
}

// False with a message for a command line that makes no sense.
bool ParseArguments(int argc, wchar_t** argv, Arguments& arguments, std::wstring& error) {
    bool folderGiven = false;
    for (int index = 1; index < argc; ++index) {
        const std::wstring argument = argv[index];
        if (argument == L"--help" || argument == L"-h") {
            arguments.help = true;
        } else if (argument == L"--trace") {
            arguments.trace = true;
        } else if (argument == L"--view") {
            if (index + 1 >= argc || !ParseViewMode(argv[index + 1], arguments.viewMode)) {
                error = L"--view takes large, small, list or details.\n";
                return false;
            }
            ++index;
        } else if (argument.starts_with(L"--") || folderGiven) {
            error = L"Unknown argument " + argument + L"\n";
            return false;
        } else {
            arguments.folder = argument;
            folderGiven = true;
        }
    }
    return true;
}

std::wstring Hex(HRESULT value) {
    wchar_t text[16];
    std::swprintf(text, 16, L"0x%08lX", static_cast<unsigned long>(value));
    return text;
}

std::wstring FailureMessage(const std::wstring& folder, BrowseStep step, HRESULT result) {
    const bool isDefault = folder == kDefaultFolder;
    const std::wstring name =
        L"\"" + (isDefault ? std::wstring(kDefaultFolderName) : folder) + L"\"";
    const std::wstring code = L" (" + Hex(result) + L")";
    switch (step) {
        case BrowseStep::Parse:
        case BrowseStep::Bind:
            // An extension that is not registered fails either way, depending on the shell.
            if (isDefault)
                return L"The folder " + name + L" cannot be opened" + code +
                       L": register LVShellExt.dll with regsvr32 first.\n";
            return step == BrowseStep::Parse
                       ? L"There is no " + name + L" in the shell's namespace" + code + L".\n"
                       : L"The folder " + name + L" cannot be opened" + code + L".\n";
        case BrowseStep::CreateView:
            return L"The folder " + name + L" has no view of its own" + code + L".\n";
        case BrowseStep::CreateViewWindow:
            return L"The view of the folder " + name + L" could not make its window" + code +
                   L".\n";
        case BrowseStep::None:
            break;
    }
    return L"The browser window could not be made" + code + L".\n";
}

int Explore(const Arguments& arguments) {
    ExplorerOptions options;
    options.viewMode = arguments.viewMode;
    options.visible = false;  // shown once the folder is there, so that a failure shows no window
    if (arguments.trace)
        options.trace = [](const std::wstring& call) { PrintUtf8(call + L"\n"); };
    ComPtr<CExplorerWindow> window;
    HRESULT result = CExplorerWindow::Create(options, window);
    if (SUCCEEDED(result))
        result = window->BrowseToParsingName(arguments.folder.c_str());
    if (FAILED(result)) {
        PrintUtf8(FailureMessage(arguments.folder, window ? window->FailedStep() : BrowseStep::None,
                                 result));
        if (window)
            window->Close();
        return 1;
    }
    ::ShowWindow(window->Window(), SW_SHOW);
    ::UpdateWindow(window->Window());
    const int status = RunExplorerMessageLoop(*window.Get());
    window->Close();
    return status;
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
    Arguments arguments;
    std::wstring error;
    if (!ParseArguments(argc, argv, arguments, error)) {
        PrintUtf8(error + kUsage);
        return 2;
    }
    if (arguments.help) {
        PrintUtf8(kUsage);
        return 0;
    }
    // OLE, not only COM: the view's drag and drop and clipboard need it.
    if (FAILED(::OleInitialize(nullptr))) {
        PrintUtf8(L"OLE could not be initialised.\n");
        return 1;
    }
    const INITCOMMONCONTROLSEX controls{sizeof(controls),
                                        ICC_BAR_CLASSES | ICC_LISTVIEW_CLASSES | ICC_ANIMATE_CLASS};
    ::InitCommonControlsEx(&controls);
    const int status = Explore(arguments);
    ::OleUninitialize();
    return status;
}
