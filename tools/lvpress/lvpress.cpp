// lvpress: waits for a visible dialog with the given title and clicks one of its buttons, as a
// user at the keyboard would. For unattended demonstrations and end-to-end tests.
#include <windows.h>

#include <cstdio>
#include <cwchar>
#include <string>
#include <vector>

#include "tools/common/console_output.h"

namespace {

const wchar_t kUsage[] =
    L"Usage: lvpress --title TITLE --button TEXT [--after SECONDS] [--timeout SECONDS]\n"
    L"               [--print-text]\n"
    L"Waits until a visible dialog titled TITLE exists, waits SECONDS more (default 0), then\n"
    L"clicks its button labelled TEXT. With --print-text it first prints each text the dialog\n"
    L"shows (its static controls), one line each as \"text: ...\", line breaks made spaces,\n"
    L"and after the click waits until the dialog has gone.\n"
    L"Exit codes: 0 pressed, 1 no such dialog or button in time.\n";

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

// The texts a user reads in the dialog: its static controls that show text, in tab order. A
// message box's text is one of them; its icon is a static too, without text.
std::vector<std::wstring> StaticTexts(HWND dialog) {
    std::vector<std::wstring> texts;
    for (HWND child = ::GetWindow(dialog, GW_CHILD); child;
         child = ::GetWindow(child, GW_HWNDNEXT)) {
        wchar_t className[16] = {};
        ::GetClassNameW(child, className, ARRAYSIZE(className));
        const LONG_PTR type = ::GetWindowLongPtrW(child, GWL_STYLE) & SS_TYPEMASK;
        const bool showsText = type == SS_LEFT || type == SS_CENTER || type == SS_RIGHT ||
                               type == SS_SIMPLE || type == SS_LEFTNOWORDWRAP;
        if (_wcsicmp(className, L"Static") != 0 || !showsText)
            continue;
        std::wstring text(static_cast<size_t>(::GetWindowTextLengthW(child)) + 1, L'\0');
        text.resize(::GetWindowTextW(child, text.data(), static_cast<int>(text.size())));
        // A system message ends with a line break and may hold several: one line each here.
        std::wstring line;
        for (wchar_t c : text) {
            const bool lineBreak = c == L'\r' || c == L'\n';
            if (!lineBreak)
                line += c;
            else if (!line.empty() && line.back() != L' ')
                line += L' ';
        }
        while (!line.empty() && line.back() == L' ')
            line.pop_back();
        if (!line.empty())
            texts.push_back(line);
    }
    return texts;
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
    std::wstring title, button;
    double after = 0, timeout = 60;
    bool printText = false;
    for (int i = 1; i < argc; ++i) {
        const std::wstring option = argv[i];
        if (option == L"--print-text") {
            printText = true;
            continue;
        }
        if (i + 1 >= argc)
            break;
        const wchar_t* value = argv[++i];
        if (option == L"--title")
            title = value;
        else if (option == L"--button")
            button = value;
        else if (option == L"--after")
            after = _wtof(value);
        else if (option == L"--timeout")
            timeout = _wtof(value);
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
    if (printText) {
        for (const std::wstring& text : StaticTexts(search.found))
            PrintUtf8(L"text: " + text + L"\n");
    }
    while (::GetTickCount64() < deadline) {
        if (HWND target = FindButton(search.found, button)) {
            // The click goes through the dialog's own message loop, exactly as a mouse click.
            ::PostMessageW(target, BM_CLICK, 0, 0);
            // A caller reading texts dialog by dialog must not meet this one again: wait until it
            // has gone (or the time is up) before saying it was pressed.
            while (printText && ::IsWindow(search.found) && ::IsWindowVisible(search.found) &&
                   ::GetTickCount64() < deadline) {
                ::Sleep(50);
            }
            return 0;
        }
        ::Sleep(100);
    }
    fwprintf(stderr, L"lvpress: the dialog has no enabled button \"%ls\"\n", button.c_str());
    return 1;
}
