// lvpress: waits for a visible dialog with the given title and clicks one of its buttons, as a
// user at the keyboard would. For unattended demonstrations and end-to-end tests.
#include <windows.h>

#include <cstdio>
#include <cwchar>
#include <string>

namespace {

const wchar_t kUsage[] =
    L"Usage: lvpress --title TITLE --button TEXT [--after SECONDS] [--timeout SECONDS]\n"
    L"Waits until a visible dialog titled TITLE exists, waits SECONDS more (default 0), then\n"
    L"clicks its button labelled TEXT. Exit codes: 0 pressed, 1 no such dialog or button in "
    L"time.\n";

struct Search {
    const wchar_t* title;
    HWND found;
};

BOOL CALLBACK FindDialog(HWND window, LPARAM parameter) {
    auto* search = reinterpret_cast<Search*>(parameter);
    wchar_t className[16] = {};
    wchar_t title[256] = {};
    ::GetClassNameW(window, className, ARRAYSIZE(className));
    ::GetWindowTextW(window, title, ARRAYSIZE(title));
    if (::IsWindowVisible(window) && wcscmp(className, L"#32770") == 0 &&
        wcscmp(title, search->title) == 0) {
        search->found = window;
        return FALSE;
    }
    return TRUE;
}

HWND FindButton(HWND dialog, const std::wstring& label) {
    for (HWND child = ::GetWindow(dialog, GW_CHILD); child;
         child = ::GetWindow(child, GW_HWNDNEXT)) {
        wchar_t text[128] = {};
        ::GetWindowTextW(child, text, ARRAYSIZE(text));
        std::wstring plain;
        for (const wchar_t* c = text; *c; ++c) {
            if (*c != L'&')
                plain += *c;  // "&Start" reads as "Start"
        }
        if (plain == label && ::IsWindowEnabled(child))
            return child;
    }
    return nullptr;
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
    std::wstring title, button;
    double after = 0, timeout = 60;
    for (int i = 1; i + 1 < argc; i += 2) {
        const std::wstring option = argv[i];
        if (option == L"--title")
            title = argv[i + 1];
        else if (option == L"--button")
            button = argv[i + 1];
        else if (option == L"--after")
            after = _wtof(argv[i + 1]);
        else if (option == L"--timeout")
            timeout = _wtof(argv[i + 1]);
    }
    if (title.empty() || button.empty()) {
        fputws(kUsage, stdout);
        return 2;
    }
    const ULONGLONG deadline = ::GetTickCount64() + static_cast<ULONGLONG>(timeout * 1000);
    Search search{title.c_str(), nullptr};
    while (!search.found && ::GetTickCount64() < deadline) {
        ::EnumWindows(FindDialog, reinterpret_cast<LPARAM>(&search));
        if (!search.found)
            ::Sleep(100);
    }
    if (!search.found) {
        fwprintf(stderr, L"lvpress: no dialog \"%ls\" appeared\n", title.c_str());
        return 1;
    }
    ::Sleep(static_cast<DWORD>(after * 1000));
    while (::GetTickCount64() < deadline) {
        if (HWND target = FindButton(search.found, button)) {
            // The click goes through the dialog's own message loop, exactly as a mouse click.
            ::PostMessageW(target, BM_CLICK, 0, 0);
            return 0;
        }
        ::Sleep(100);
    }
    fwprintf(stderr, L"lvpress: the dialog has no enabled button \"%ls\"\n", button.c_str());
    return 1;
}
