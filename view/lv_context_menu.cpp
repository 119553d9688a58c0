// The background menu's sample command.
#include "view/lv_context_menu.h"

#include <algorithm>
#include <cstring>

#include "support/user_interface.h"

namespace {

// The command strings are copied with this limit whatever the caller's buffer holds, as the menu
// always did.
constexpr size_t kCommandStringLimit = 32;

void CopyCommandString(CHAR* buffer, UINT capacity, const char* text) noexcept {
    // A buffer smaller than the limit is not written past.
    const size_t limit = capacity < kCommandStringLimit ? capacity : kCommandStringLimit;
    if (!buffer || limit == 0)
        return;
    const size_t length = std::min(std::strlen(text), limit - 1);
    std::memcpy(buffer, text, length);
    buffer[length] = '\0';
}

}  // namespace

HRESULT CLVContextMenu::QueryInterface(REFIID iid, void** object) {
    static const QITAB table[] = {QITABENT(CLVContextMenu, IContextMenu), {}};
    return QISearch(this, table, iid, object);
}

HRESULT CLVContextMenu::QueryContextMenu(HMENU menu, UINT position, UINT firstCommand, UINT,
                                         UINT flags) {
    if (flags & CMF_DEFAULTONLY)
        return MAKE_HRESULT(SEVERITY_SUCCESS, FACILITY_NULL, 0);
    if (!::InsertMenuW(menu, position, MF_BYPOSITION | MF_STRING, firstCommand,
                       L"&Sample Explorer Bar Command"))
        return E_FAIL;
    return MAKE_HRESULT(SEVERITY_SUCCESS, FACILITY_NULL, 1);
}

HRESULT CLVContextMenu::InvokeCommand(CMINVOKECOMMANDINFO* info) {
    if (!info || !IS_INTRESOURCE(info->lpVerb) || LOWORD(info->lpVerb) != 0)
        return E_INVALIDARG;
    ShowMessageBox(info->hwnd, L"Explorer Bar Command selected.", L"Sample Explorer Bar",
                   MB_ICONINFORMATION);
    return S_OK;
}

HRESULT CLVContextMenu::GetCommandString(UINT_PTR command, UINT type, UINT*, CHAR* name,
                                         UINT capacity) {
    if (command != 0)
        return E_INVALIDARG;
    switch (type) {
        case GCS_VERBW:
            // 8-bit text in a buffer meant for wide text, as the menu always answered.
            CopyCommandString(name, capacity, "command");
            return S_OK;
        case GCS_HELPTEXTW:
            CopyCommandString(name, capacity, "Explorer Bar command help text");
            return S_OK;
        case GCS_VALIDATEW:
            return S_OK;
        default:
            return E_INVALIDARG;
    }
}
