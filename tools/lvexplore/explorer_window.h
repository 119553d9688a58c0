// CExplorerWindow: a small shell browser that hosts any folder's IShellView as Explorer does, with
// a menu bar for the view to merge into, a toolbar (Back, Up) and a status bar.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <functional>
#include <string>
#include <vector>

#include "support/com_object.h"
#include "support/unique_resource.h"
#include "tools/lvexplore/browser_menus.h"
#include "tools/lvexplore/item_id_list.h"

struct ExplorerOptions {
    // Also answers QueryInterface(IID_ICommDlgBrowser), as a file dialog's browser does:
    // OnDefaultCommand is counted and returns S_OK, IncludeObject and OnStateChange return S_OK.
    bool commonDialog = false;
    // InsertMenusSB, SetMenuSB, RemoveMenusSB, SetStatusTextSB, SendControlMsg and
    // GetControlWindow return E_NOTIMPL, as Wine's browsers do.
    bool menusNotImplemented = false;
    // FOLDERSETTINGS.ViewMode for the first view (FVM_ICON..FVM_DETAILS); later views get the mode
    // the previous view reports, as Explorer carries it from folder to folder.
    UINT viewMode = FVM_ICON;
    bool visible = true;
    // Called with each IShellBrowser call the view makes, e.g. L"SetMenuSB(shared menu)".
    std::function<void(const std::wstring& call)> trace = nullptr;
};

// The step at which the last browse failed.
enum class BrowseStep {
    None,
    Parse,             // the name is not in the namespace
    Bind,              // the folder could not be bound from the desktop
    CreateView,        // the folder has no view (CreateViewObject(IID_IShellView) failed)
    CreateViewWindow,  // the view could not create its window
};

// The frame owns the view and the view holds the browser: Close() (or WM_CLOSE) ends that cycle;
// release the window only after it.
class CExplorerWindow final : public ComObject<IShellBrowser, ICommDlgBrowser> {
public:
    [[nodiscard]] static HRESULT Create(const ExplorerOptions& options,
                                        Microsoft::WRL::ComPtr<CExplorerWindow>& window) noexcept;

    // Binds the folder from the desktop, asks it for its view and shows that view in place of the
    // current one; the current folder goes into the history for Back.
    [[nodiscard]] HRESULT BrowseTo(PCIDLIST_ABSOLUTE folder) noexcept;
    // SHParseDisplayName, then BrowseTo.
    [[nodiscard]] HRESULT BrowseToParsingName(const wchar_t* parsingName) noexcept;
    // Shows a view the caller made (from a folder of its own) as the view of that folder.
    [[nodiscard]] HRESULT BrowseToView(IShellView* view, PCIDLIST_ABSOLUTE folder) noexcept;
    BrowseStep FailedStep() const noexcept { return failedStep_; }

    // False when there is nothing to go back or up to, or the browse failed.
    [[nodiscard]] bool GoBack() noexcept;
    [[nodiscard]] bool GoUp() noexcept;

    IShellView* View() const noexcept { return view_.Get(); }
    PCIDLIST_ABSOLUTE CurrentFolder() const noexcept { return current_.get(); }
    HWND Window() const noexcept { return frame_.get(); }
    HWND ViewWindow() const noexcept { return viewWindow_; }
    HWND StatusBar() const noexcept { return status_; }
    HWND Toolbar() const noexcept { return toolbar_; }
    // The menu on the frame: the one SetMenuSB set, else the browser's own.
    HMENU MenuBar() const noexcept;
    std::wstring StatusText(int part = 0) const;
    int StatusPartCount() const;
    int BrowseRequestCount() const noexcept { return browseRequests_; }

    // The view's TranslateAccelerator first (S_OK: handled), then the frame's own keys (F5,
    // Alt+Left, Backspace). True when the message must not be dispatched.
    bool TranslateThroughView(MSG& message);
    // Runs the message loop (through TranslateThroughView) for that long, for tests.
    void PumpMessages(DWORD milliseconds);
    // Deactivates and destroys the view, destroys the frame.
    void Close() noexcept;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;

    // IOleWindow
    IFACEMETHODIMP GetWindow(HWND* window) override;
    IFACEMETHODIMP ContextSensitiveHelp(BOOL) override { return E_NOTIMPL; }

    // IShellBrowser
    IFACEMETHODIMP InsertMenusSB(HMENU shared, OLEMENUGROUPWIDTHS* widths) override;
    IFACEMETHODIMP SetMenuSB(HMENU shared, HOLEMENU, HWND) override;
    IFACEMETHODIMP RemoveMenusSB(HMENU shared) override;
    IFACEMETHODIMP SetStatusTextSB(LPCWSTR text) override;
    IFACEMETHODIMP EnableModelessSB(BOOL) override { return S_OK; }
    IFACEMETHODIMP TranslateAcceleratorSB(MSG* message, WORD id) override;
    IFACEMETHODIMP BrowseObject(PCUIDLIST_RELATIVE list, UINT flags) override;
    IFACEMETHODIMP GetViewStateStream(DWORD mode, IStream** stream) override;
    IFACEMETHODIMP GetControlWindow(UINT id, HWND* window) override;
    IFACEMETHODIMP SendControlMsg(UINT id, UINT message, WPARAM wParam, LPARAM lParam,
                                  LRESULT* result) override;
    IFACEMETHODIMP QueryActiveShellView(IShellView** view) override;
    IFACEMETHODIMP OnViewWindowActive(IShellView* view) override;
    IFACEMETHODIMP SetToolbarItems(TBBUTTON* buttons, UINT count, UINT flags) override;

    // ICommDlgBrowser
    IFACEMETHODIMP OnDefaultCommand(IShellView* view) override;
    IFACEMETHODIMP OnStateChange(IShellView* view, ULONG change) override;
    IFACEMETHODIMP IncludeObject(IShellView* view, PCUITEMID_CHILD item) override;

private:
    template <typename T, typename... Arguments>
    friend Microsoft::WRL::ComPtr<T> MakeComObject(Arguments&&... arguments);
    friend int RunExplorerMessageLoop(CExplorerWindow& window);

    // Popups lent to a view's shared menu; kept until the next insertion after their return.
    struct LentPopups {
        HMENU shared;
        BrowserPopups popups;
        bool returned;
    };

    explicit CExplorerWindow(const ExplorerOptions& options);
    ~CExplorerWindow() override;

    [[nodiscard]] HRESULT CreateFrame() noexcept;
    [[nodiscard]] HRESULT CreateControls(HWND frame) noexcept;
    [[nodiscard]] HRESULT Navigate(PCIDLIST_ABSOLUTE folder, bool remember) noexcept;
    [[nodiscard]] HRESULT ShowView(IShellView* view, PCIDLIST_ABSOLUTE folder,
                                   bool remember) noexcept;
    [[nodiscard]] HRESULT NavigateBack() noexcept;
    [[nodiscard]] HRESULT NavigateUp() noexcept;
    FOLDERSETTINGS NextFolderSettings() const noexcept;
    void ReleaseView() noexcept;
    void ForgetLentPopups(bool all) noexcept;
    RECT ViewArea() const noexcept;
    void Layout() noexcept;
    void ShowPlace() noexcept;
    HWND ControlWindow(UINT id) const noexcept;
    void OnCommand(WPARAM wParam, LPARAM lParam);
    void Trace(const wchar_t* format, ...) const noexcept;
    LRESULT HandleMessage(HWND frame, UINT message, WPARAM wParam, LPARAM lParam);
    static LRESULT CALLBACK WindowProcedure(HWND frame, UINT message, WPARAM wParam, LPARAM lParam);

    ExplorerOptions options_;
    UniqueWindow frame_;
    HWND toolbar_ = nullptr;  // children of the frame, destroyed with it
    HWND status_ = nullptr;
    UniqueMenu menuBar_;  // the browser's own; taken off the frame before the frame goes
    UniqueAccelerators accelerators_;
    std::vector<LentPopups> lent_;
    Microsoft::WRL::ComPtr<IShellView> view_;
    HWND viewWindow_ = nullptr;
    UniqueAbsoluteIdList current_;
    std::vector<UniqueAbsoluteIdList> history_;
    BrowseStep failedStep_ = BrowseStep::None;
    int browseRequests_ = 0;
    bool quitWhenDestroyed_ = false;
};

// The program's message loop: runs until the frame is closed; the exit code of WM_QUIT.
int RunExplorerMessageLoop(CExplorerWindow& window);
