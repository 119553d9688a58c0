// The browser that hosts folder views: Wine's own file-system view in it, and the browser's side
// of menu merging, status bar, navigation and keys through a view of the test's own (FakeView).
#include <windows.h>
#include <commctrl.h>
#include <shlobj.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <vector>

#include "support/module_lock.h"
#include "tests/explorer_host/fake_shell_view.h"
#include "tools/lvexplore/explorer_window.h"

using Microsoft::WRL::ComPtr;

namespace {

UniqueAbsoluteIdList Parse(const wchar_t* name) {
    PIDLIST_ABSOLUTE list = nullptr;
    EXPECT_EQ(S_OK, ::SHParseDisplayName(name, nullptr, &list, 0, nullptr)) << name;
    return UniqueAbsoluteIdList(list);
}

RECT Bounds(HWND window) {
    RECT bounds{};
    ::GetWindowRect(window, &bounds);
    return bounds;
}

class ExplorerHost : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_TRUE(SUCCEEDED(::OleInitialize(nullptr))); }
    void TearDown() override {
        if (window_)
            window_->Close();
        window_.Reset();
        view_.Reset();
        ::OleUninitialize();
        EXPECT_EQ(0, ModuleLockCount()) << "the browser or a view was kept alive";
    }

    void Open(ExplorerOptions options = {}) {
        if (window_)
            window_->Close();
        options.visible = false;
        ASSERT_EQ(S_OK, CExplorerWindow::Create(options, window_));
    }
    void OpenOnFakeView(const wchar_t* place, const ExplorerOptions& options = {}) {
        Open(options);
        view_ = MakeComObject<FakeView>();
        ASSERT_EQ(S_OK, window_->BrowseToView(view_.Get(), Parse(place).get()));
    }
    IShellBrowser* Browser() const { return window_.Get(); }
    HMENU Popup(HMENU menu, UINT id) const {
        MENUITEMINFOW item{};
        item.cbSize = sizeof(item);
        item.fMask = MIIM_SUBMENU;
        return ::GetMenuItemInfoW(menu, id, FALSE, &item) ? item.hSubMenu : nullptr;
    }
    bool IsAt(const wchar_t* place) const {
        return ::ILIsEqual(window_->CurrentFolder(), Parse(place).get());
    }
    std::wstring Place() const {
        return ShellItemName(window_->CurrentFolder(), SIGDN_DESKTOPABSOLUTEPARSING);
    }

    ComPtr<CExplorerWindow> window_;
    ComPtr<FakeView> view_;
};

// Browsing away from a view deactivates and destroys it; Wine's view takes its place.
TEST_F(ExplorerHost, WineFileSystemView_ReplacesTheOldViewBetweenToolbarAndStatusBar) {
    OpenOnFakeView(L"C:\\");
    HWND oldWindow = window_->ViewWindow();
    ASSERT_EQ(S_OK, window_->BrowseToParsingName(L"C:\\windows"));
    EXPECT_EQ(static_cast<UINT>(SVUIA_DEACTIVATE), view_->state);
    EXPECT_FALSE(::IsWindow(oldWindow));
    ASSERT_NE(nullptr, window_->View());
    HWND fromView = nullptr;
    EXPECT_EQ(S_OK, window_->View()->GetWindow(&fromView));
    EXPECT_EQ(window_->ViewWindow(), fromView);
    EXPECT_EQ(window_->Window(), ::GetParent(window_->ViewWindow()));
    EXPECT_GE(Bounds(window_->ViewWindow()).top, Bounds(window_->Toolbar()).bottom);
    EXPECT_LE(Bounds(window_->ViewWindow()).bottom, Bounds(window_->StatusBar()).top);
}

// The popups, their shell ids and the View separator are seen by the view's own menu tests.
TEST_F(ExplorerHost, MenusSB_CountFileAndEditFirstAndViewThirdAndComeOutAliveForTheBrowsersOwn) {
    OpenOnFakeView(L"C:\\");
    const LONG expected[6] = {2, 0, 1, 0, 0, 0};  // File and Edit; View
    EXPECT_TRUE(std::equal(expected, expected + 6, view_->widths.width));
    HMENU shared = window_->MenuBar();
    const HMENU popups[] = {Popup(shared, FCIDM_MENU_FILE), Popup(shared, FCIDM_MENU_EDIT),
                            Popup(shared, FCIDM_MENU_VIEW)};
    EXPECT_EQ(S_OK, Browser()->RemoveMenusSB(shared));
    EXPECT_EQ(0, ::GetMenuItemCount(shared));
    for (HMENU popup : popups)
        EXPECT_TRUE(::IsMenu(popup));
    EXPECT_NE(shared, window_->MenuBar());
    EXPECT_NE(nullptr, Popup(window_->MenuBar(), FCIDM_MENU_FILE));
}

TEST_F(ExplorerHost, MenuCommand_OfAMergedItemGoesToTheViewWindowAndTheBrowsersStaysWithIt) {
    OpenOnFakeView(L"C:\\");
    ASSERT_NE(-1, static_cast<int>(::GetMenuState(window_->MenuBar(), kViewCommand, MF_BYCOMMAND)));
    // As the menu sends them.
    ::SendMessageW(window_->Window(), WM_COMMAND, MAKEWPARAM(kViewCommand, 0), 0);
    ::SendMessageW(window_->Window(), WM_COMMAND, MAKEWPARAM(kCommandRefresh, 0), 0);
    EXPECT_EQ(std::vector<UINT>{kViewCommand}, view_->commands);
    EXPECT_EQ(1, view_->refreshes);
}

TEST_F(ExplorerHost, StatusBar_ShowsWhatTheViewSendsAndAnswersItAsTheToolbarDoes) {
    OpenOnFakeView(L"C:\\");
    EXPECT_EQ(L"Fake status", window_->StatusText(0));
    int edges[] = {100, -1};
    LRESULT result = 0;
    EXPECT_EQ(S_OK, Browser()->SendControlMsg(FCW_STATUS, SB_SETPARTS, 2,
                                              reinterpret_cast<LPARAM>(edges), &result));
    EXPECT_TRUE(result);
    EXPECT_EQ(2, window_->StatusPartCount());
    EXPECT_EQ(S_OK, Browser()->SetStatusTextSB(L"Part one"));
    EXPECT_EQ(L"Part one", window_->StatusText(0));
    // GetControlWindow gives these two controls only.
    const struct {
        UINT id;
        HRESULT result;
        HWND window;
    } cases[] = {{FCW_STATUS, S_OK, window_->StatusBar()},
                 {FCW_TOOLBAR, S_OK, window_->Toolbar()},
                 {FCW_TREE, E_FAIL, nullptr}};
    for (const auto& entry : cases) {
        HWND window = reinterpret_cast<HWND>(1);
        EXPECT_EQ(entry.result, Browser()->GetControlWindow(entry.id, &window)) << entry.id;
        EXPECT_EQ(entry.window, window) << entry.id;
    }
}

TEST_F(ExplorerHost, MenusNotImplemented_AnswersENotImplAsWinesBrowsersDo) {
    OpenOnFakeView(L"C:\\", {.menusNotImplemented = true});
    HWND control = nullptr;
    OLEMENUGROUPWIDTHS widths{};
    const std::function<HRESULT(IShellBrowser*)> calls[] = {
        [&](IShellBrowser* b) { return b->InsertMenusSB(view_->menu, &widths); },
        [&](IShellBrowser* b) { return b->SetMenuSB(view_->menu, nullptr, nullptr); },
        [&](IShellBrowser* b) { return b->RemoveMenusSB(view_->menu); },
        [](IShellBrowser* b) { return b->SetStatusTextSB(L"text"); },
        [](IShellBrowser* b) { return b->SendControlMsg(FCW_STATUS, SB_SETTEXTW, 0, 0, nullptr); },
        [&](IShellBrowser* b) { return b->GetControlWindow(FCW_STATUS, &control); }};
    for (const auto& call : calls)
        EXPECT_EQ(E_NOTIMPL, call(Browser()));
    EXPECT_NE(view_->menu, window_->MenuBar());
    EXPECT_EQ(L"", window_->StatusText(0));
}

TEST_F(ExplorerHost, BrowseObject_FollowsRelativeParentAndBackRequestsAfterAnUnknownName) {
    Open();
    EXPECT_FALSE(window_->GoBack()) << "nowhere to go";
    EXPECT_FALSE(window_->GoUp()) << "nowhere to go";
    EXPECT_FALSE(SUCCEEDED(window_->BrowseToParsingName(L"C:\\no such folder")));
    EXPECT_EQ(BrowseStep::Parse, window_->FailedStep());
    EXPECT_EQ(nullptr, window_->View());
    ASSERT_EQ(S_OK, window_->BrowseToParsingName(L"C:\\windows"));
    const UniqueAbsoluteIdList system32 = Parse(L"C:\\windows\\system32");
    const struct {
        PCUIDLIST_RELATIVE list;
        UINT flags;
        const wchar_t* place;
    } steps[] = {{::ILFindLastID(system32.get()), SBSP_RELATIVE, L"C:\\windows\\system32"},
                 {nullptr, SBSP_PARENT, L"C:\\windows"},
                 {nullptr, SBSP_NAVIGATEBACK, L"C:\\windows\\system32"}};
    for (const auto& step : steps) {
        EXPECT_EQ(S_OK, Browser()->BrowseObject(step.list, step.flags)) << std::hex << step.flags;
        EXPECT_TRUE(IsAt(step.place)) << Place();
    }
}

TEST_F(ExplorerHost, FrameKeys_ActOnlyWhenTheViewLeavesThem) {
    const struct {
        WPARAM key;
        bool viewTakesIt;
    } cases[] = {{VK_BACK, false}, {VK_BACK, true}, {VK_F5, false}, {VK_F5, true}};
    for (const auto& entry : cases) {
        SCOPED_TRACE(testing::Message()
                     << "key " << entry.key << ", view takes it " << entry.viewTakesIt);
        OpenOnFakeView(L"C:\\windows");
        view_->keyTaken = entry.viewTakesIt ? entry.key : 0;
        MSG key{window_->ViewWindow(), WM_KEYDOWN, entry.key, 1, 0, {}};
        EXPECT_TRUE(window_->TranslateThroughView(key));
        const bool frameActed = view_->refreshes > 0 || !IsAt(L"C:\\windows");
        EXPECT_EQ(!entry.viewTakesIt, frameActed) << Place();
    }
}

}  // namespace
