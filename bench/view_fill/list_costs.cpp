// A bare list control's inserts and text requests, plain and subclassed, and one server call.
#include "bench/view_fill/list_costs.h"

#include <commctrl.h>

#include "bench/view_fill/stopwatch.h"
#include "support/module_instance.h"
#include "support/unique_resource.h"

namespace {

LRESULT CALLBACK AnswerDisplayRequests(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
    if (message == WM_NOTIFY &&
        reinterpret_cast<const NMHDR*>(lParam)->code == static_cast<UINT>(LVN_GETDISPINFOW)) {
        auto& info = reinterpret_cast<NMLVDISPINFOW*>(lParam)->item;
        if ((info.mask & LVIF_TEXT) && info.pszText && info.cchTextMax > 0)
            lstrcpynW(info.pszText, L"Level 0001", info.cchTextMax);
        if (info.mask & LVIF_IMAGE)
            info.iImage = 0;
        return 0;
    }
    return ::DefWindowProcW(window, message, wParam, lParam);
}

LRESULT CALLBACK PassEverything(HWND window, UINT message, WPARAM wParam, LPARAM lParam, UINT_PTR,
                                DWORD_PTR) {
    return ::DefSubclassProc(window, message, wParam, lParam);
}

}  // namespace

BareList MeasureBareList(int itemCount, bool subclassed, bool visible, bool details) {
    static const ATOM parentClass = [] {
        WNDCLASSW parent{};
        parent.lpfnWndProc = &AnswerDisplayRequests;
        parent.hInstance = ThisModule();
        parent.lpszClassName = L"ViewFillBenchParent";
        return ::RegisterClassW(&parent);
    }();
    BareList figures;
    UniqueWindow parent(::CreateWindowExW(0, MAKEINTATOM(parentClass), L"view_fill_bench",
                                          WS_OVERLAPPEDWINDOW | (visible ? WS_VISIBLE : 0), 0, 0,
                                          800, 600, nullptr, nullptr, ThisModule(), nullptr));
    if (!parent)
        return figures;
    const DWORD type = details ? LVS_REPORT : LVS_ICON;
    // Destroyed with its parent.
    const HWND list = ::CreateWindowExW(
        WS_EX_CLIENTEDGE, WC_LISTVIEWW, L"",
        WS_CHILD | WS_VISIBLE | LVS_AUTOARRANGE | LVS_SHAREIMAGELISTS | LVS_SHOWSELALWAYS | type, 0,
        0, 780, 560, parent.get(), nullptr, ThisModule(), nullptr);
    if (!list)
        return figures;
    if (subclassed)
        ::SetWindowSubclass(list, &PassEverything, 1, 0);
    if (type == LVS_REPORT) {
        wchar_t name[] = L"Name";
        LVCOLUMNW column{};
        column.mask = LVCF_TEXT | LVCF_WIDTH;
        column.cx = 200;
        column.pszText = name;
        ListView_InsertColumn(list, 0, &column);
    }
    ::SendMessageW(list, WM_SETREDRAW, FALSE, 0);
    LONGLONG start = Ticks();
    for (int index = 0; index < itemCount; ++index) {
        LVITEMW item{};
        item.mask = LVIF_TEXT | LVIF_IMAGE | LVIF_PARAM;
        item.iItem = index;
        item.pszText = LPSTR_TEXTCALLBACKW;
        item.iImage = I_IMAGECALLBACK;
        item.lParam = index + 1;
        ::SendMessageW(list, LVM_INSERTITEMW, 0, reinterpret_cast<LPARAM>(&item));
    }
    figures.inserts = MillisecondsSince(start);
    ::SendMessageW(list, WM_SETREDRAW, TRUE, 0);
    start = Ticks();
    for (int index = 0; index < itemCount; ++index) {
        wchar_t text[MAX_PATH] = {};
        ListView_GetItemText(list, index, 0, text, ARRAYSIZE(text));
    }
    figures.texts = MillisecondsSince(start);
    if (subclassed)
        ::RemoveWindowSubclass(list, &PassEverything, 1);
    return figures;
}

double ServerRoundTripMicroseconds(HWND window) {
    constexpr int kCalls = 500;
    const LONGLONG start = Ticks();
    for (int call = 0; call < kCalls; ++call)
        (void)::GetPropW(window, L"ViewFillBenchNothing");
    return MillisecondsSince(start) * 1000.0 / kCalls;
}
