// Files dropped on the view's list: the rows that may be dropped on, a drop on a station row and
// in a station's folder, and a real drag of two files from another thread.
#include "tests/view/view_fixture.h"

#include "tests/drop/drop_fixture.h"
#include "view/lv_drop_target.h"

namespace {

class ViewDropTest : public ShellViewTest {
protected:
    void SetUp() override {
        ShellViewTest::SetUp();
        SetDroppedSourcesReceiver([this](const std::wstring& station,
                                         const std::shared_ptr<TSourceList>& sources) {
            received_.push_back({station, *sources});
        });
    }
    void TearDown() override {
        SetDroppedSourcesReceiver(nullptr);
        ShellViewTest::TearDown();
    }

    // The target the view registers on its list, made the same way for the folder it shows.
    ComPtr<CLVDropTargetOnListView> ListTarget(CExplorerWindow& browser,
                                               const std::wstring& folderPath) {
        auto target = MakeComObject<CLVDropTargetOnListView>();
        UniquePidl folder(manager_.CreatePidlFromPath(folderPath.c_str()));
        EXPECT_EQ(S_OK, target->SetUp(List(browser), browser.View(),
                                      reinterpret_cast<PCUIDLIST_RELATIVE>(folder.get())));
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

TEST_F(ViewDropTest, TheFirstRowIsNeverATargetAndAStationRowIsSelectedAndFocused) {
    AddStationOfModel(L"North");
    CExplorerWindow& browser = Open(L"", Details());
    auto target = ListTarget(browser, L"Quorvel Digital Level");
    DWORD effect = DROPEFFECT_NONE;
    EXPECT_EQ(E_INVALIDARG, target->DragOver(0, RowPoint(browser, 0), &effect));
    EXPECT_EQ(static_cast<DWORD>(DROPEFFECT_NONE), effect);
    EXPECT_EQ(0u, RowState(browser, 0) | RowState(browser, 1));
    EXPECT_EQ(S_OK, target->DragOver(0, RowPoint(browser, 1), &effect));
    EXPECT_EQ(static_cast<DWORD>(DROPEFFECT_COPY), effect);
    EXPECT_EQ(static_cast<UINT>(LVIS_SELECTED | LVIS_FOCUSED), RowState(browser, 1));
}

TEST_F(ViewDropTest, ADropOnAStationRowIsTheStationsDropAndOneInItsFolderIsRefusedAfterParsing) {
    AddStationOfModel(L"North");
    const std::wstring file = scratch_.File(L"job.lv");
    auto data = MakeComObject<BlockDataObject>();
    data->blocks[CF_HDROP] = DropFilesBlock({file});
    const TSourceList expected{{file, file, 0}};

    CExplorerWindow& top = Open(L"", Details());
    DWORD effect = DROPEFFECT_COPY;
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
    AddStationOfModel(L"North");
    AddStationOfModel(L"South");
    const std::wstring first = scratch_.File(L"a.lv");
    const std::wstring second = scratch_.File(L"b.lv");
    CExplorerWindow& browser = Open(L"", Details());
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
