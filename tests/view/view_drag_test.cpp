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

// A plain top-level window under the cursor that records what is dropped on it; a static control
// would not do, as it lets the cursor's hit test through to whatever lies below it.
class TargetUnderTheCursor {
public:
    TargetUnderTheCursor() {
        WNDCLASSW windowClass{};
        windowClass.lpfnWndProc = ::DefWindowProcW;
        windowClass.lpszClassName = L"ViewTestDropTarget";
        (void)::RegisterClassW(&windowClass);  // registered already by an earlier test
        window_.reset(::CreateWindowExW(WS_EX_TOPMOST, windowClass.lpszClassName, L"",
                                        WS_POPUP | WS_VISIBLE, 800, 600, 200, 200, nullptr,
                                        nullptr, nullptr, nullptr));
        EXPECT_TRUE(window_);
        EXPECT_EQ(S_OK, ::RegisterDragDrop(window_.get(), target_.Get()));
        EXPECT_TRUE(::SetCursorPos(900, 700));
    }
    ~TargetUnderTheCursor() { EXPECT_EQ(S_OK, ::RevokeDragDrop(window_.get())); }
    const std::vector<std::wstring>& Dropped() const { return target_->dropped; }

private:
    UniqueWindow window_;
    ComPtr<RecordingDropTarget> target_ = MakeComObject<RecordingDropTarget>();
};

// Only a station's files are dragged: the top folder's stations start no drag.
TEST_F(ShellViewTest, AFileDraggedOutOfAStationReachesATargetWithItsNameAndAStationNone) {
    AddStationOfModel(L"S");
    const TargetUnderTheCursor target;
    CExplorerWindow& top = Open();
    Select(top, {1});
    NotifyFromList(top, LVN_BEGINDRAG, 1, 0);
    EXPECT_TRUE(target.Dropped().empty());

    CExplorerWindow& station = Open(L"S");
    station.PumpMessages(50);
    Select(station, {0});
    NotifyFromList(station, LVN_BEGINDRAG, 0, 0);
    EXPECT_EQ(Names{L"file1.lv"}, target.Dropped());
}

}  // namespace
