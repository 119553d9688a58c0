// Files dropped on the view's list: the rows that may be dropped on, a drop on a station row and
// in a station's folder, and a real drag of two files from another thread.
#include "tests/view/view_fixture.h"

#include "tests/drop/drop_fixture.h"
#include "server/class_table.h"
#include "server/lv_shell_folder.h"
#include "view/lv_drop_target.h"

namespace {

class ViewDropTest : public ShellViewTest {
protected:
    // The target the view registers on its list, made the same way for the folder it shows, and
    // handed a receiver that records what is dropped.
    ComPtr<CLVDropTargetOnListView> ListTarget(CExplorerWindow& browser,
                                               const std::wstring& folderPath) {
        auto target = MakeComObject<CLVDropTargetOnListView>();
        UniqueRelativePidl folder = manager_.CreatePidlFromPath(folderPath.c_str());
        EXPECT_EQ(S_OK, target->SetUp(List(browser), browser.View(), folder.get()));
        EXPECT_EQ(S_OK, target->SetReceiver([this](const std::wstring& station,
                                                   const std::shared_ptr<TSourceList>& sources) {
            received_.push_back({station, *sources});
        }));
        return target;
    }

    static POINTL RowPoint(CExplorerWindow& browser, int row) {
        RECT area{};
        area.left = LVIR_LABEL;
        ::SendMessageW(List(browser), LVM_GETITEMRECT, row, reinterpret_cast<LPARAM>(&area));
        POINT point{(area.left + area.right) / 2, (area.top + area.bottom) / 2};
        ::ClientToScreen(List(browser), &point);
        return POINTL{point.x, point.y};
    }

    static UINT RowState(CExplorerWindow& browser, int row) {
        return ListView_GetItemState(List(browser), row, LVIS_SELECTED | LVIS_FOCUSED);
    }

    std::vector<std::pair<std::wstring, TSourceList>> received_;
    ScratchFolder scratch_;
};

// The first row is never a target; a station row is, selected and focused under the drag, and a
// drop on it is the station's; a drop in a station's folder is refused once it has been parsed.
TEST_F(ViewDropTest, OnlyAStationRowOfTheTopFolderTakesADrop) {
    AddStationOfModel(L"North");
    const std::wstring file = scratch_.File(L"job.lv");
    auto data = MakeComObject<BlockDataObject>();
    data->blocks[CF_HDROP] = DropFilesBlock({file});
    const TSourceList expected{{file, file, 0}};

    CExplorerWindow& top = Open(L"", Details());
    auto target = ListTarget(top, L"Quorvel Digital Level");
    DWORD effect = DROPEFFECT_NONE;
    EXPECT_EQ(E_INVALIDARG, target->DragOver(0, RowPoint(top, 0), &effect));
    EXPECT_EQ(static_cast<DWORD>(DROPEFFECT_NONE), effect);
    EXPECT_EQ(0u, RowState(top, 0) | RowState(top, 1));
    EXPECT_EQ(S_OK, target->DragOver(0, RowPoint(top, 1), &effect));
    EXPECT_EQ(static_cast<DWORD>(DROPEFFECT_COPY), effect);
    EXPECT_EQ(static_cast<UINT>(LVIS_SELECTED | LVIS_FOCUSED), RowState(top, 1));

    EXPECT_EQ(S_FALSE, ListTarget(top, L"Quorvel Digital Level")
                           ->Drop(data.Get(), 0, RowPoint(top, 1), &effect));
    EXPECT_EQ(E_INVALIDARG, ListTarget(top, L"Quorvel Digital Level")
                                ->Drop(data.Get(), 0, RowPoint(top, 0), &effect));
    CExplorerWindow& station = Open(L"North", Details());
    EXPECT_EQ(E_INVALIDARG, ListTarget(station, L"Quorvel Digital Level\\North")
                                ->Drop(data.Get(), 0, RowPoint(station, 0), &effect));
    ASSERT_EQ(2u, received_.size());
    EXPECT_EQ(L"North", received_[0].first);
    EXPECT_EQ(expected, received_[0].second);
    EXPECT_EQ(expected, received_[1].second);
}

// The folder class made available to the shell in this process, as registration does for
// Explorer: the class object through COM, and the class key without which the shell refuses the
// class before asking COM (E_ACCESSDENIED); the key's values are not read.
class FolderClassForTheShell {
public:
    FolderClassForTheShell() {
        ComPtr<IClassFactory> factory;
        EXPECT_EQ(S_OK, GetClassObject(CLSID_LVShellFolder, IID_PPV_ARGS(&factory)));
        EXPECT_EQ(S_OK, ::CoRegisterClassObject(CLSID_LVShellFolder, factory.Get(),
                                                CLSCTX_INPROC_SERVER, REGCLS_MULTIPLEUSE,
                                                &cookie_));
        EXPECT_EQ(ERROR_SUCCESS, ::RegCreateKeyExW(HKEY_CLASSES_ROOT, kServerKey, 0, nullptr, 0,
                                                   KEY_WRITE, nullptr, key_.put(), nullptr));
    }
    ~FolderClassForTheShell() {
        (void)::CoRevokeClassObject(cookie_);  // nothing to undo when it was never registered
        key_.reset();
        (void)::RegDeleteTreeW(HKEY_CLASSES_ROOT, kClassKey);  // likewise
    }

private:
    static constexpr wchar_t kClassKey[] = L"CLSID\\{7D3F2A61-4B8E-4C19-9A27-5E0C81B6D4F3}";
    static constexpr wchar_t kServerKey[] =
        L"CLSID\\{7D3F2A61-4B8E-4C19-9A27-5E0C81B6D4F3}\\InprocServer32";
    DWORD cookie_ = 0;
    UniqueRegKey key_;
};

// A station's file dragged from a shell window arrives as a shell item with no file-system path:
// its own data object is parsed, one level deep, and names the file the station would send.
TEST_F(ViewDropTest, AStationsFileDraggedAsAShellItemIsParsedThroughItsOwnDataObject) {
    AddStationOfModel(L"North");
    FolderClassForTheShell shellClass;
    ComPtr<IShellFolder> desktop;
    ASSERT_EQ(S_OK, ::SHGetDesktopFolder(&desktop));
    std::wstring path =
        L"::{20D04FE0-3AEA-1069-A2D8-08002B30309D}\\::{7D3F2A61-4B8E-4C19-9A27-5E0C81B6D4F3}"
        L"\\North";
    UniqueAbsoluteIdList station;
    ASSERT_EQ(S_OK, desktop->ParseDisplayName(nullptr, nullptr, path.data(), nullptr,
                                              reinterpret_cast<PIDLIST_RELATIVE*>(station.put()),
                                              nullptr));
    ComPtr<IShellFolder> stationFolder;
    ASSERT_EQ(S_OK, desktop->BindToObject(station.get(), nullptr, IID_PPV_ARGS(&stationFolder)));
    ComPtr<IEnumIDList> items;
    ASSERT_EQ(S_OK, stationFolder->EnumObjects(nullptr, SHCONTF_NONFOLDERS, &items));
    UniqueChildPidl file;
    ASSERT_EQ(S_OK, items->Next(1, file.put(), nullptr));

    auto data = MakeComObject<BlockDataObject>();
    data->blocks[RegisteredFormat(ClipboardFormat::ShellIdList)] =
        IdListArrayBlock(station.get(), {file.get()});
    TSourceParser parser(true);
    EXPECT_EQ(S_OK, parser.ParseDataObject(data.Get(), L"", true));
    // The root is the directory part of the file's parsing name: the station's own.
    const TSourceList expected{
        {L"::{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}\\North", L"file1.lv", 0}};
    EXPECT_EQ(expected, *parser.Sources());
}

// Drops as soon as the drag starts: no button is held.
class DroppingSource final : public ComObjectImpl<false, IDropSource> {
public:
    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override {
        static const QITAB table[] = {QITABENT(DroppingSource, IDropSource), {}};
        return QISearch(this, table, iid, object);
    }
    IFACEMETHODIMP QueryContinueDrag(BOOL escape, DWORD keys) override {
        if (escape)
            return DRAGDROP_S_CANCEL;
        return (keys & MK_LBUTTON) ? S_OK : DRAGDROP_S_DROP;
    }
    IFACEMETHODIMP GiveFeedback(DWORD) override { return DRAGDROP_S_USEDEFAULTCURSORS; }
};

TEST_F(ViewDropTest, TwoFilesDraggedFromAnotherThreadReachTheStationUnderTheCursor) {
    AddStationsOfModel({L"North", L"South"});
    const std::wstring first = scratch_.File(L"a.lv");
    const std::wstring second = scratch_.File(L"b.lv");
    CExplorerWindow& browser = Open(L"", Details());
    // The view registered a target on its list; one made the same way, with a receiver that
    // records, takes its place for the drag.
    ASSERT_EQ(S_OK, ::RevokeDragDrop(List(browser)));
    ASSERT_EQ(S_OK, ::RegisterDragDrop(List(browser),
                                       ListTarget(browser, L"Quorvel Digital Level").Get()));
    const POINTL south = RowPoint(browser, 2);
    ASSERT_TRUE(::SetCursorPos(south.x, south.y));
    browser.PumpMessages(50);

    HRESULT dragged = E_FAIL;
    DWORD effect = DROPEFFECT_NONE;
    UniqueHandle finished(::CreateEventW(nullptr, TRUE, FALSE, nullptr));
    std::thread user([&] {
        ::OleInitialize(nullptr);
        {
            auto data = MakeComObject<BlockDataObject>();
            data->blocks[CF_HDROP] = DropFilesBlock({first, second});
            auto source = MakeComObject<DroppingSource>();
            dragged = ::DoDragDrop(data.Get(), source.Get(), DROPEFFECT_COPY, &effect);
        }
        ::OleUninitialize();
        ::SetEvent(finished.get());
    });
    const HANDLE waitFor = finished.get();
    for (int rounds = 0; rounds < 200 && ::WaitForSingleObject(waitFor, 0) != WAIT_OBJECT_0;
         ++rounds)
        browser.PumpMessages(25);
    user.join();
    EXPECT_EQ(DRAGDROP_S_DROP, dragged);
    ASSERT_EQ(1u, received_.size());
    EXPECT_EQ(L"South", received_[0].first);
    EXPECT_EQ((TSourceList{{first, first, 0}, {second, second, 0}}), received_[0].second);
    EXPECT_EQ(static_cast<UINT>(LVIS_SELECTED | LVIS_FOCUSED), RowState(browser, 2));
}

}  // namespace
