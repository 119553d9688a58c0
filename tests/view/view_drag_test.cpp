// A drag of a station's file out of the view, dropped on a window of the same process, driven as
// Wine's own drag-and-drop tests drive one: the cursor is placed, and the source's
// QueryContinueDrag sees no button held and drops at once.
#include "tests/view/view_fixture.h"

#include "support/clipboard_formats.h"

namespace {

class RecordingDropTarget final : public ComObjectImpl<false, IDropTarget> {
public:
    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override {
        static const QITAB table[] = {QITABENT(RecordingDropTarget, IDropTarget), {}};
        return QISearch(this, table, iid, object);
    }
    IFACEMETHODIMP DragEnter(IDataObject*, DWORD, POINTL, DWORD* effect) override {
        *effect = DROPEFFECT_COPY;
        return S_OK;
    }
    IFACEMETHODIMP DragOver(DWORD, POINTL, DWORD* effect) override {
        *effect = DROPEFFECT_COPY;
        return S_OK;
    }
    IFACEMETHODIMP DragLeave() override { return S_OK; }
    // Reads only the file's name: asking for its contents would start a download.
    IFACEMETHODIMP Drop(IDataObject* data, DWORD, POINTL, DWORD* effect) override {
        FORMATETC format{RegisteredFormat(ClipboardFormat::FileGroupDescriptor), nullptr,
                         DVASPECT_CONTENT, -1, TYMED_HGLOBAL};
        STGMEDIUM medium{};
        if (SUCCEEDED(data->GetData(&format, &medium))) {
            GlobalLockGuard lock(medium.hGlobal);
            const auto* group = static_cast<const FILEGROUPDESCRIPTORW*>(lock.data());
            for (UINT index = 0; group && index < group->cItems; ++index)
                dropped.push_back(group->fgd[index].cFileName);
        }
        ::ReleaseStgMedium(&medium);
        *effect = DROPEFFECT_COPY;
        return S_OK;
    }

    std::vector<std::wstring> dropped;
};

// A plain top-level window under the cursor; a static control would not do, as it lets the
// cursor's hit test through to whatever lies below it.
UniqueWindow CreateTargetWindow() {
    WNDCLASSW windowClass{};
    windowClass.lpfnWndProc = ::DefWindowProcW;
    windowClass.lpszClassName = L"ViewTestDropTarget";
    ::RegisterClassW(&windowClass);
    return UniqueWindow(::CreateWindowExW(WS_EX_TOPMOST, L"ViewTestDropTarget", L"",
                                          WS_POPUP | WS_VISIBLE, 800, 600, 200, 200, nullptr,
                                          nullptr, nullptr, nullptr));
}

TEST_F(ShellViewTest, AFileDraggedOutOfAStationReachesATargetWithItsName) {
    AddStationOfModel(L"S");
    CExplorerWindow& browser = Open(L"S");
    UniqueWindow targetWindow = CreateTargetWindow();
    ASSERT_TRUE(targetWindow);
    auto target = MakeComObject<RecordingDropTarget>();
    ASSERT_EQ(S_OK, ::RegisterDragDrop(targetWindow.get(), target.Get()));
    ASSERT_TRUE(::SetCursorPos(900, 700));
    browser.PumpMessages(50);

    Select(browser, {0});
    NotifyFromList(browser, LVN_BEGINDRAG, 0, 0);
    EXPECT_EQ(std::vector<std::wstring>{L"file1.lv"}, target->dropped);
    EXPECT_EQ(S_OK, ::RevokeDragDrop(targetWindow.get()));
}

TEST_F(ShellViewTest, TheTopFolderStartsNoDrag) {
    AddStationOfModel(L"S");
    CExplorerWindow& browser = Open();
    UniqueWindow targetWindow = CreateTargetWindow();
    auto target = MakeComObject<RecordingDropTarget>();
    ASSERT_EQ(S_OK, ::RegisterDragDrop(targetWindow.get(), target.Get()));
    ASSERT_TRUE(::SetCursorPos(900, 700));
    Select(browser, {1});
    NotifyFromList(browser, LVN_BEGINDRAG, 1, 0);
    EXPECT_TRUE(target->dropped.empty());
    EXPECT_EQ(S_OK, ::RevokeDragDrop(targetWindow.get()));
}

}  // namespace
