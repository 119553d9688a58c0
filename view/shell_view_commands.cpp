// The view's commands: add, open, delete, edit, copy and paste stations, the view modes, the
// drag of a station's file, and the keys that ask for them.
#include "view/shell_view_commands.h"

#include <functional>
#include <thread>

#include "download/dialog_station_downloader.h"
#include "download/portable/driver_text.h"
#include "res/ids_download.h"
#include "res/ids_stations.h"
#include "res/ids_view.h"
#include "stations/portable/pasted_stations.h"
#include "stations/station_dialog.h"
#include "stations/station_list_block.h"
#include "stations/station_store.h"
#include "stations/store_failure_text.h"
#include "support/clipboard_formats.h"
#include "support/error_handling.h"
#include "support/module_instance.h"
#include "support/text_lookup.h"
#include "support/user_interface.h"
#include "view/lv_data_object.h"
#include "view/view_notify_window.h"

namespace {

// The drag image moves with the cursor and keeps the distance from the cursor to the item where
// the drag began. The data object moves it to the cursor's screen position plus this offset, and
// image positions count from the list's window corner.
POINT DragImageOffset(HWND list, POINT imageOrigin) {
    POINT cursor{};
    ::GetCursorPos(&cursor);
    POINT client = cursor;
    ::ScreenToClient(list, &client);
    RECT frame{};
    ::GetWindowRect(list, &frame);
    return POINT{imageOrigin.x - client.x - frame.left, imageOrigin.y - client.y - frame.top};
}

// Runs work on a thread of its own and returns when it has ended; false, with nothing run, when
// no thread could be had. Meanwhile this thread answers what other threads and processes send to
// its windows and repaints them, so the view and its browser stay responsive; input and posted
// messages (commands among them) wait until the work is done, so nothing the user does runs in
// the middle of it.
[[nodiscard]] bool RunAnsweringMessages(const std::function<void()>& work) noexcept {
    UniqueHandle done(::CreateEventW(nullptr, TRUE, FALSE, nullptr));
    if (!done)
        return false;
    std::thread worker;
    try {
        worker = std::thread([&work, event = done.get()] {
            work();
            ::SetEvent(event);
        });
    } catch (...) {
        return false;  // no thread: the caller does the work itself
    }
    const HANDLE handles[] = {done.get()};
    // Until the work is done or the wait itself fails; the join then waits for the thread.
    while (::MsgWaitForMultipleObjectsEx(1, handles, INFINITE, QS_SENDMESSAGE | QS_PAINT,
                                         MWMO_INPUTAVAILABLE) == WAIT_OBJECT_0 + 1) {
        // Peeking delivers the sent messages; of the queue only a paint message is taken, one per
        // wake, so that a window that never validates costs time, not a hang.
        MSG message;
        if (::PeekMessageW(&message, nullptr, WM_PAINT, WM_PAINT, PM_REMOVE))
            ::DispatchMessageW(&message);
    }
    worker.join();
    return true;
}

// The refusal in the words of the string table.
std::wstring PasteRefusalText(const PasteRefused& refused) {
    const std::wstring name = NameForMessage(refused.name);
    switch (refused.reason) {
        case PasteRefusal::kTooManyStations:
        case PasteRefusal::kBlockTooLarge:
            return FormatText(
                LoadUiText(IDS_PASTE_TOO_MANY),
                {DecimalText(kMaximumPastedStations), DecimalText(kMaximumPastedBlockSize / 1024)});
        case PasteRefusal::kUnreadable:
            return FormatText(LoadUiText(IDS_PASTE_UNREADABLE),
                              {DecimalText(static_cast<long long>(refused.station) + 1), name});
        case PasteRefusal::kCopyTooLong:
            return FormatText(LoadUiText(IDS_PASTE_COPY_TOO_LONG), {name});
    }
    return std::wstring();
}

}  // namespace

void CShellViewCommands::LoadAccelerators() noexcept {
    accelerators_.reset(::LoadAcceleratorsW(ThisModule(), MAKEINTRESOURCEW(IDR_VIEW_ACCELERATORS)));
}

void CShellViewCommands::TranslateAccelerator(MSG& message) noexcept {
    if (context_.window && accelerators_ &&
        ::TranslateAcceleratorW(context_.window, accelerators_.get(), &message)) {
        translatedKey_ = message.wParam;
        translatedKeyTime_ = static_cast<LONG>(message.time);
    }
}

void CShellViewCommands::OnListKeyDown(WORD key) {
    // The message being dispatched is the one the browser already gave to TranslateAccelerator.
    if (translatedKey_ == key && translatedKeyTime_ == ::GetMessageTime()) {
        translatedKey_ = 0;
        return;
    }
    if (!accelerators_)
        return;
    MSG message{};
    message.hwnd = list_.Window();
    message.message = WM_KEYDOWN;
    message.wParam = key;
    message.time = static_cast<DWORD>(::GetMessageTime());
    ::TranslateAcceleratorW(context_.window, accelerators_.get(), &message);
}

void CShellViewCommands::OnCommand(UINT command) {
    // While a paste stores its stations only messages sent from elsewhere are answered: a command
    // among them is dropped rather than run in the middle of the paste.
    if (pasting_)
        return;
    if (const UINT mode = ViewModeOfCommand(command)) {
        SetViewMode(mode);
        return;
    }
    switch (command) {
        case IDM_REFRESH:
            (void)list_.Refresh();  // without a list there is nothing to refresh
            break;
        case IDM_CREATE_STATION:
            AddStation();
            break;
        case IDM_COPY:
            CopySelection();
            break;
        case IDM_PASTE:
            PasteStations();
            break;
        case IDM_PROPERTIES:
            EditSelectedStations();
            break;
        case IDM_DELETE:
            DeleteSelection();
            break;
        case IDM_OPEN:
            OpenSelection();
            break;
        default:
            break;
    }
}

void CShellViewCommands::ChangedStations() {
    (void)list_.Refresh();
    BroadcastStationsChanged(context_.folder.kind);
}

void CShellViewCommands::AddStation() {
    Station station = DefaultStation();
    station.Name = MakeUniqueStationName(LoadUiText(IDS_NEW_DIGITAL_LEVEL));
    CStationDialog dialog(context_.window, station, true);
    // The sheet stores the station itself; Cancel stores nothing.
    if (dialog.DoModal() == IDOK || dialog.Added())
        ChangedStations();
}

void CShellViewCommands::OpenSelection() {
    const std::vector<SelectedItem> selection = list_.Selection();
    if (selection.empty())
        return;
    const SelectedItem& first = selection.front();
    if (context_.folder.IsTopFolder() && !first.item) {
        AddStation();
        return;
    }
    if (!first.item || !context_.browser)
        return;
    // Browsing destroys this view and its list (Wine's browsers do it before returning): keep
    // the view and the identifier alive across the call.
    Microsoft::WRL::ComPtr<IShellView> keepAlive(&context_.view);
    Microsoft::WRL::ComPtr<ICommDlgBrowser> dialogBrowser = context_.dialogBrowser;
    const UniqueRelativePidl item = manager_.CopyPidl(first.item);
    if (!item)
        return;
    if (FAILED(context_.browser->BrowseObject(item.get(), SBSP_DEFBROWSER | SBSP_RELATIVE)) &&
        dialogBrowser) {
        // A file is not a folder to browse to: in a file dialog, opening it chooses it.
        (void)dialogBrowser->OnDefaultCommand(&context_.view);
    }
}

void CShellViewCommands::DeleteSelection() {
    if (!context_.folder.IsTopFolder())
        return;
    const std::vector<SelectedItem> selection = list_.Selection();
    if (selection.empty())
        return;
    std::vector<std::wstring> notDeleted;
    HRESULT firstRefusal = S_OK;
    for (const SelectedItem& selected : selection) {
        if (!selected.item)
            continue;  // the entry is not a station
        Station station;
        station.Name = manager_.GetItemName(selected.item);
        const HRESULT deleted = ::DeleteStation(station);
        // A station deleted meanwhile (in another view) is simply gone; the refresh shows it.
        if (FAILED(deleted) && deleted != E_INVALIDARG) {
            if (SUCCEEDED(firstRefusal))
                firstRefusal = deleted;
            notDeleted.push_back(std::move(station.Name));
        }
    }
    ChangedStations();
    // The store logged each refusal; the user hears of them once, over the refreshed list.
    if (!notDeleted.empty()) {
        ShowMessageBox(context_.window,
                       StationsNotChangedText(IDS_DELETE_FAILED, notDeleted, firstRefusal),
                       LoadUiText(IDS_DIGITAL_LEVELS), MB_ICONERROR);
    }
}

void CShellViewCommands::EditSelectedStations() {
    // The names first: each OK refreshes the list, which frees the items' identifiers.
    std::vector<std::wstring> names;
    for (const SelectedItem& selected : list_.Selection()) {
        if (selected.item)
            names.push_back(manager_.GetItemName(selected.item));
    }
    if (names.empty())
        return;
    for (const std::wstring& name : names) {
        Station station;
        station.Name = name;
        // A station deleted since it was listed has no sheet to show.
        if (FAILED(FindStation(station)))
            continue;
        CStationDialog dialog(context_.window, station, false);
        if (dialog.DoModal() == IDOK)
            (void)list_.Refresh();
    }
    BroadcastStationsChanged(context_.folder.kind);
}

void CShellViewCommands::CopySelection() {
    if (context_.folder.kind != PT_ROOT && context_.folder.kind != PT_STATION)
        return;
    const std::vector<SelectedItem> selection = list_.Selection();
    if (selection.empty())
        return;
    auto dataObject = MakeComObject<CLVDataObject>(MakeDialogStationDownloader());
    // The entry alone copies nothing, and leaves the clipboard as it was. The clipboard keeps the
    // object and renders from it on request.
    if (AddSelectedItems(*dataObject.Get(), selection) == S_OK)
        (void)::OleSetClipboard(dataObject.Get());
}

HRESULT CShellViewCommands::AddSelectedItems(
    CLVDataObject& dataObject, const std::vector<SelectedItem>& selection) const noexcept {
    try {
        bool added = false;
        for (const SelectedItem& selected : selection) {
            if (!selected.item)
                continue;  // the entry is not an item of the folder
            const UniqueRelativePidl full = CreateFullItem(selected.item);
            // Part of the selection on the clipboard or in a drag would be a lie.
            RETURN_IF_NULL_ALLOC(full.get());
            RETURN_IF_FAILED(dataObject.AddItem(full.get()));
            added = true;
        }
        if (!added)
            return S_FALSE;
        // Where the shell has our folder, for the parent of "Shell IDList Array". A folder that was
        // never placed (S_FALSE) leaves that format out; the others still carry the selection.
        Microsoft::WRL::ComPtr<IPersistFolder2> persist;
        UniqueAbsoluteIdList location;
        if (SUCCEEDED(context_.folder.folder.As(&persist)) &&
            persist->GetCurFolder(location.put()) == S_OK)
            RETURN_IF_FAILED(dataObject.SetFolderLocation(location.get()));
        return S_OK;
    }
    CATCH_RETURN()
}

void CShellViewCommands::PasteStations() {
    if (!context_.folder.IsTopFolder())
        return;
    // A message answered while the stations are stored may close the browser and release the
    // view: it stays alive until this command has returned.
    Microsoft::WRL::ComPtr<IShellView> keepAlive(&context_.view);
    Microsoft::WRL::ComPtr<IDataObject> clipboard;
    if (FAILED(::OleGetClipboard(&clipboard)) || !clipboard)
        return;
    FORMATETC format{RegisteredFormat(ClipboardFormat::StationList), nullptr, DVASPECT_CONTENT, -1,
                     TYMED_HGLOBAL};
    UniqueStgMedium medium;
    if (format.cfFormat == 0 || FAILED(clipboard->GetData(&format, medium.put())))
        return;
    if (!medium.global())
        return;
    // Any process can put a block there: one over the limits is refused before it is decoded.
    std::optional<PasteRefused> refused;
    {
        GlobalLockGuard lock(medium.global());
        refused = CheckPastedBlock(static_cast<const uint8_t*>(lock.data()), lock.size());
    }
    std::vector<Station> stations;
    if (!refused && (FAILED(ParseStationList(medium.global(), stations)) || stations.empty()))
        return;
    if (!refused)
        refused = PasteParsedStations(std::move(stations));
    if (refused) {
        ShowMessageBox(context_.window, PasteRefusalText(*refused), LoadUiText(IDS_DIGITAL_LEVELS),
                       MB_ICONERROR);
    }
}

std::optional<PasteRefused> CShellViewCommands::PasteParsedStations(std::vector<Station> stations) {
    // The text in this thread's language; the worker has a language of its own.
    const std::wstring copyPrefix = LoadUiText(IDS_COPY_OF);
    PasteOutcome outcome;
    const std::function<void()> paste = [&]() noexcept {
        outcome = AddPastedStations(std::move(stations), copyPrefix);
    };
    // Linear now, a thousand stations into a thousand still take about 0.3 s under Wine
    // (bench/station_store, on a busy 2-core machine), every value one call to the registry, and
    // more on a slow profile: under a second, but more than the moment a window may stop
    // answering, and any program can hand us such a block. So the store is read and written on
    // a worker while this thread waits, answering what other threads and processes send and
    // repainting. Waiting keeps the command whole: it ends with the stations stored, as the
    // refresh, the broadcast and every caller expect, and the worker never outlives the view.
    pasting_ = true;
    if (!RunAnsweringMessages(paste))
        paste();
    pasting_ = false;
    if (outcome.refused)
        return outcome.refused;
    // Logged by the store; all or nothing, so the message names every station of the block.
    if (FAILED(outcome.result)) {
        ShowMessageBox(context_.window,
                       StationsNotChangedText(IDS_PASTE_FAILED, outcome.names, outcome.result),
                       LoadUiText(IDS_DIGITAL_LEVELS), MB_ICONERROR);
    }
    // Once, for the whole block; after a failure too, for the rare key that would not go again.
    ChangedStations();
    return std::nullopt;
}

void CShellViewCommands::SetViewMode(UINT mode) {
    list_.SetViewMode(mode);
    (void)list_.Refresh();
    if (mode == FVM_ICON)
        list_.Send(LVM_ARRANGE, LVA_SNAPTOGRID);
    // Rebuilt, so that the radio mark moves.
    menus_.BuildMenus();
}

void CShellViewCommands::BeginDrag() {
    // Only a station's file leaves by drag; stations themselves move by copy and paste.
    if (context_.folder.kind != PT_STATION)
        return;
    const std::vector<SelectedItem> selection = list_.Selection();
    if (selection.empty())
        return;
    auto dataObject = MakeComObject<CLVDataObject>(MakeDialogStationDownloader());
    if (AddSelectedItems(*dataObject.Get(), selection) != S_OK)
        return;
    POINT origin{};
    const int first = selection.front().index;
    const HIMAGELIST image = reinterpret_cast<HIMAGELIST>(
        list_.Send(LVM_CREATEDRAGIMAGE, first, reinterpret_cast<LPARAM>(&origin)));
    if (image) {
        const POINT offset = DragImageOffset(list_.Window(), origin);
        dataObject->SetDragImage(image, list_.Window(), offset.x, offset.y);
    }
    DWORD effect = DROPEFFECT_NONE;
    // The target decides what happens; the source has nothing to do afterwards.
    (void)::DoDragDrop(dataObject.Get(), dataObject.Get(), DROPEFFECT_COPY, &effect);
}

UniqueRelativePidl CShellViewCommands::CreateFullItem(PCUITEMID_CHILD item) const {
    const std::wstring path = context_.folder.path + L'\\' + manager_.GetItemName(item);
    return manager_.CreatePidlFromPath(path.c_str());
}
