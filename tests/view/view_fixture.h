// The folder's view in a browser of our own over a scratch store: opening a folder, waiting for
// the fill, reading the list and menus, and acting on property sheets from another thread.
#pragma once

#include <windows.h>
#include <commctrl.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "namespace/icon_lists.h"
#include "namespace/pidl_manager.h"
#include "res/resource.h"
#include "server/lv_shell_folder.h"
#include "support/class_factory.h"
#include "support/module_instance.h"
#include "support/module_lock.h"
#include "support/registered_messages.h"
#include "tests/progress_dialogs/dialog_driver.h"
#include "tests/stations/station_builders.h"
#include "tests/support/recording_user_interface.h"
#include "tests/support/registry_override.h"
#include "tools/lvexplore/explorer_window.h"

using Microsoft::WRL::ComPtr;
using Names = std::vector<std::wstring>;

// The top folder's first item, which starts adding a station.
inline constexpr wchar_t kEntry[] = L"Add New Digital Level";

// Acts on each sheet that the given thread shows, one after the other, from a thread of its own.
class SheetUser {
public:
    using Script = std::function<void(const StationPage&)>;

    SheetUser(DWORD viewThread, std::vector<Script> scripts)
        : thread_([this, viewThread, scripts = std::move(scripts)] {
              for (const Script& script : scripts) {
                  HWND frame = nullptr;
                  const auto shown = [&] {
                      frame = VisibleDialogOf(viewThread);
                      return frame && StationPage{frame}.Shown();
                  };
                  if (!WaitFor(shown, 10000)) {
                      ADD_FAILURE() << "no sheet appeared";
                      return;
                  }
                  ::Sleep(100);
                  script(StationPage{frame});
                  ++handled_;
                  (void)WaitFor([&] { return !::IsWindow(frame); }, 5000);
              }
          }) {}
    ~SheetUser() { thread_.join(); }
    int Handled() const { return handled_; }

private:
    int handled_ = 0;
    std::thread thread_;
};

class ShellViewTest : public ::testing::Test {
protected:
    static void SetUpTestSuite() {
        INITCOMMONCONTROLSEX controls{sizeof controls, ICC_WIN95_CLASSES | ICC_ANIMATE_CLASS};
        ::InitCommonControlsEx(&controls);
        RegisterWindowMessages();
        ASSERT_TRUE(BuildSharedIconLists(ThisModule()));
    }

    void SetUp() override {
        ASSERT_EQ(S_OK, ::OleInitialize(nullptr));
        threadWindows_ = ThreadWindowCount();
        guiObjects_ = ::GetGuiResources(::GetCurrentProcess(), GR_GDIOBJECTS);
        userObjects_ = ::GetGuiResources(::GetCurrentProcess(), GR_USEROBJECTS);
    }

    void TearDown() override {
        for (ComPtr<CExplorerWindow>& browser : browsers_)
            browser->Close();
        browsers_.clear();
        // Posted broadcasts and late fill results find no window now; let them go.
        MSG message;
        while (::PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE))
            ::DispatchMessageW(&message);
        // Emptied, not flushed: flushing renders every listed format with lindex -1, for which
        // the data object answers FileContents with S_FALSE and no stream, and Wine's flush reads
        // that missing stream.
        (void)::OleSetClipboard(nullptr);
        ::OleUninitialize();
        // A lock left over is an object of the module that the view leaked.
        EXPECT_EQ(0, ModuleLockCount());
        // Windows left behind (a view's hidden notification window, say) are counted here, since
        // Wine reports no object counts (0 before and after); Windows does, and then they match.
        EXPECT_EQ(threadWindows_, ThreadWindowCount());
        EXPECT_EQ(guiObjects_, ::GetGuiResources(::GetCurrentProcess(), GR_GDIOBJECTS));
        EXPECT_EQ(userObjects_, ::GetGuiResources(::GetCurrentProcess(), GR_USEROBJECTS));
    }

    // Opens the top folder (station empty) or a station's folder in a new browser and waits for
    // the first fill.
    CExplorerWindow& Open(const std::wstring& station = L"", ExplorerOptions options = {}) {
        ComPtr<IShellFolder> folder;
        EXPECT_EQ(S_OK, CreateComInstance<CLVShellFolder>(IID_PPV_ARGS(&folder)));
        ComPtr<IPersistFolder> persist;
        EXPECT_EQ(S_OK, folder.As(&persist));
        EXPECT_EQ(S_OK, persist->Initialize(nullptr));
        UniqueRelativePidl own = CPidlMgr::AsList(manager_.CreateRootPidl());
        if (!station.empty()) {
            const UniqueChildPidl item =
                manager_.CreateItemPidl((L"Quorvel Digital Level\\" + station).c_str());
            ComPtr<IShellFolder> stationFolder;
            EXPECT_EQ(S_OK,
                      folder->BindToObject(item.get(), nullptr, IID_PPV_ARGS(&stationFolder)));
            folder = stationFolder;
            own = manager_.ConcatPidls(own.get(), item.get());
        }
        ComPtr<IShellView> view;
        EXPECT_EQ(S_OK, folder->CreateViewObject(nullptr, IID_PPV_ARGS(&view)));
        ComPtr<CExplorerWindow> browser;
        options.visible = true;
        EXPECT_EQ(S_OK, CExplorerWindow::Create(options, browser));
        // The browser's record of where it is: My Computer, then the folder's own items.
        UniqueAbsoluteIdList computer;
        EXPECT_EQ(S_OK, ::SHGetSpecialFolderLocation(nullptr, CSIDL_DRIVES, computer.put()));
        UniqueAbsoluteIdList absolute(::ILCombine(computer.get(), own.get()));
        EXPECT_EQ(S_OK, browser->BrowseToView(view.Get(), absolute.get()));
        browsers_.push_back(browser);
        WaitForFill(*browser.Get());
        return *browser.Get();
    }

    static ExplorerOptions Details() { return {.viewMode = FVM_DETAILS}; }

    static void AddStationsOfModel(std::initializer_list<const wchar_t*> names) {
        for (const wchar_t* name : names)
            AddStationOfModel(name);
    }

    static int ThreadWindowCount() {
        int count = 0;
        ::EnumThreadWindows(
            ::GetCurrentThreadId(),
            [](HWND, LPARAM counter) {
                ++*reinterpret_cast<int*>(counter);
                return TRUE;
            },
            reinterpret_cast<LPARAM>(&count));
        return count;
    }

    static HWND List(const CExplorerWindow& browser) {
        return ::GetDlgItem(browser.ViewWindow(), 2000);
    }
    static DWORD ListStyle(const CExplorerWindow& browser) {
        return ::GetWindowLongW(List(browser), GWL_STYLE) & LVS_TYPEMASK;
    }

    // Until the animation is gone: the fill's result has been put into the list.
    static void WaitForFill(CExplorerWindow& browser) {
        for (int tries = 0; tries < 100; ++tries) {
            browser.PumpMessages(30);
            if (!::GetDlgItem(browser.ViewWindow(), 1300))
                return;
        }
        ADD_FAILURE() << "the fill did not end";
    }

    // A notification of the list to the view, as the list sends it.
    static void NotifyFromList(const CExplorerWindow& browser, UINT code, int item, int subItem) {
        NMLISTVIEW info{};
        info.hdr = NMHDR{List(browser), 2000, code};
        info.iItem = item;
        info.iSubItem = subItem;
        ::SendMessageW(browser.ViewWindow(), WM_NOTIFY, 2000, reinterpret_cast<LPARAM>(&info));
    }

    static Names Texts(const CExplorerWindow& browser) {
        Names texts;
        const HWND list = List(browser);
        const int count = ListView_GetItemCount(list);
        for (int index = 0; index < count; ++index) {
            wchar_t text[300] = {};
            ListView_GetItemText(list, index, 0, text, 300);
            texts.push_back(text);
        }
        return texts;
    }

    static void Select(const CExplorerWindow& browser, std::initializer_list<int> indexes) {
        const HWND list = List(browser);
        ListView_SetItemState(list, -1, 0, LVIS_SELECTED);
        for (int index : indexes)
            ListView_SetItemState(list, index, LVIS_SELECTED | LVIS_FOCUSED,
                                  LVIS_SELECTED | LVIS_FOCUSED);
    }

    // A command as the browser's menu or IOleCommandTarget::Exec would send it.
    static HRESULT Command(CExplorerWindow& browser, DWORD command) {
        ComPtr<IOleCommandTarget> target;
        EXPECT_EQ(S_OK, browser.View()->QueryInterface(IID_PPV_ARGS(&target)));
        const HRESULT result = target->Exec(&CGID_Explorer, command, 0, nullptr, nullptr);
        WaitForFill(browser);
        return result;
    }

    CPidlMgr manager_;
    RegistryOverride registry_;
    RecordingUserInterface user_;
    ScopedUserInterface seam_{user_};
    std::vector<ComPtr<CExplorerWindow>> browsers_;
    int threadWindows_ = 0;
    DWORD guiObjects_ = 0;
    DWORD userObjects_ = 0;
};
