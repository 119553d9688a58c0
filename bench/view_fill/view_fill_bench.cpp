// Times the folder view's asynchronous fill in the project's own browser at 10, 100 and 1,000
// stations: from the call that creates the view window to a filled list, to every item's text
// asked for once, and the longest single message the user-interface thread spent meanwhile.
#include <windows.h>
#include <commctrl.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cwchar>
#include <numeric>
#include <random>
#include <string>
#include <vector>

#include "bench/view_fill/list_costs.h"
#include "bench/view_fill/stopwatch.h"
#include "namespace/icon_lists.h"
#include "namespace/pidl_manager.h"
#include "res/ids_view.h"
#include "server/lv_shell_folder.h"
#include "stations/station_store.h"
#include "support/class_factory.h"
#include "support/module_instance.h"
#include "support/registered_messages.h"
#include "support/registry_value.h"  // DeleteKeyRecursive
#include "support/unique_resource.h"
#include "tools/lvexplore/explorer_window.h"
#include "tools/lvexplore/item_id_list.h"

using Microsoft::WRL::ComPtr;

namespace {

const char kUsage[] =
    "Usage: view_fill_bench [--repetitions N] [--hidden] [--details]\n"
    "Opens the top folder's view in the project's own browser over a scratch store of 10, 100\n"
    "and 1,000 stations, N times each (default 5, after one run that is not counted), and prints\n"
    "the time to a filled list, to every item's text, and the longest message of the fill.\n"
    "The browser is visible unless --hidden; the view shows large icons unless --details.\n";

const wchar_t kScratchPath[] = L"Software\\LVShellExt View Fill Benchmark";
// A fill that has not ended by then is reported as failed rather than waited for.
constexpr double kGiveUpMilliseconds = 120000;

struct Settings {
    int repetitions = 5;
    bool visible = true;
    UINT viewMode = FVM_ICON;
};

// HKEY_CURRENT_USER redirected to a scratch key for one base of stations; the key goes with it.
class ScratchStore {
public:
    ScratchStore() {
        // A run that was interrupted leaves its stations behind; they must not be counted.
        (void)DeleteKeyRecursive(HKEY_CURRENT_USER, kScratchPath);
        if (::RegCreateKeyExW(HKEY_CURRENT_USER, kScratchPath, 0, nullptr, 0, KEY_ALL_ACCESS,
                              nullptr, key_.put(), nullptr) == ERROR_SUCCESS)
            ready_ = ::RegOverridePredefKey(HKEY_CURRENT_USER, key_.get()) == ERROR_SUCCESS;
    }
    ScratchStore(const ScratchStore&) = delete;
    ScratchStore& operator=(const ScratchStore&) = delete;
    ~ScratchStore() {
        ::RegOverridePredefKey(HKEY_CURRENT_USER, nullptr);
        key_.reset();
        (void)DeleteKeyRecursive(HKEY_CURRENT_USER, kScratchPath);
    }
    bool Ready() const noexcept { return ready_; }

private:
    UniqueRegKey key_;
    bool ready_ = false;
};

// Stations "Level 0001" to the count, added in a shuffled order so that neither the registry's
// key order nor the enumeration hands the view a list that is already sorted.
bool AddStations(int count) {
    std::vector<int> numbers(static_cast<size_t>(count));
    std::iota(numbers.begin(), numbers.end(), 1);
    std::shuffle(numbers.begin(), numbers.end(), std::mt19937(20261122));
    for (int number : numbers) {
        wchar_t name[32];
        swprintf(name, ARRAYSIZE(name), L"Level %04d", number);
        Station station = DefaultStation();
        station.Name = name;
        if (FAILED(AddStation(station)))
            return false;
    }
    return true;
}

// The top folder's view as Explorer gets it, and the place the browser records for it (My
// Computer, then the folder's root item).
struct TopFolderView {
    ComPtr<IShellFolder> folder;
    ComPtr<IShellView> view;
    UniqueAbsoluteIdList absolute;
};

HRESULT MakeTopFolderView(TopFolderView& made) {
    CPidlMgr manager;
    HRESULT result = CreateComInstance<CLVShellFolder>(IID_PPV_ARGS(&made.folder));
    if (FAILED(result))
        return result;
    ComPtr<IPersistFolder> persist;
    if (FAILED(result = made.folder.As(&persist)) || FAILED(result = persist->Initialize(nullptr)))
        return result;
    if (FAILED(result = made.folder->CreateViewObject(nullptr, IID_PPV_ARGS(&made.view))))
        return result;
    UniqueAbsoluteIdList computer;
    if (FAILED(result = ::SHGetSpecialFolderLocation(nullptr, CSIDL_DRIVES, computer.put())))
        return result;
    UniqueChildPidl own = manager.CreateRootPidl();
    made.absolute.reset(::ILCombine(computer.get(), own.get()));
    return made.absolute ? S_OK : E_OUTOFMEMORY;
}

struct Run {
    bool complete = false;
    double createCall = 0;      // BrowseToView alone: the view window, its list, the thread start
    double filled = 0;          // BrowseToView to the animation gone and every item in the list
    double texts = 0;           // ... and then every item's text asked for once
    double longestMessage = 0;  // the longest single dispatch until the list was filled
    double fillMessage = 0;     // the dispatch of the enumerator's message: inserts and sort
    int messages = 0;
    int emptyTexts = 0;
};

// Texts and images the list asked the view for, seen on their way to the view window.
struct DisplayRequests {
    int texts = 0;
    int images = 0;
};

LRESULT CALLBACK CountDisplayRequests(HWND window, UINT message, WPARAM wParam, LPARAM lParam,
                                      UINT_PTR, DWORD_PTR counter) {
    if (message == WM_NOTIFY &&
        reinterpret_cast<const NMHDR*>(lParam)->code == static_cast<UINT>(LVN_GETDISPINFOW)) {
        auto& requests = *reinterpret_cast<DisplayRequests*>(counter);
        const auto& info = *reinterpret_cast<const NMLVDISPINFOW*>(lParam);
        requests.texts += (info.item.mask & LVIF_TEXT) != 0;
        requests.images += (info.item.mask & LVIF_IMAGE) != 0;
    }
    return ::DefSubclassProc(window, message, wParam, lParam);
}

HWND ListOf(const CExplorerWindow& browser) {
    return ::GetDlgItem(browser.ViewWindow(), IDC_VIEW_LIST);
}

// Opens the top folder in a new browser, runs the message loop until the fill is in the list,
// then reads every item's text. The browser is left open for the caller when keep is given; the
// list's requests for texts and images until the list is filled are counted when requests is.
Run MeasureOnce(int stationCount, const Settings& settings, ComPtr<CExplorerWindow>* keep = nullptr,
                DisplayRequests* requests = nullptr) {
    Run run;
    TopFolderView made;
    ComPtr<CExplorerWindow> browser;
    ExplorerOptions options;
    options.visible = settings.visible;
    options.viewMode = settings.viewMode;
    if (FAILED(MakeTopFolderView(made)) || FAILED(CExplorerWindow::Create(options, browser)))
        return run;

    const LONGLONG start = Ticks();
    const HRESULT browsed = browser->BrowseToView(made.view.Get(), made.absolute.get());
    run.createCall = MillisecondsSince(start);
    const HWND viewWindow = browser->ViewWindow();
    const HWND list = ListOf(*browser.Get());
    if (FAILED(browsed) || !list) {
        browser->Close();
        return run;
    }
    // The fill's result is only taken in the loop below, so nothing is missed by counting late.
    if (requests)
        ::SetWindowSubclass(viewWindow, &CountDisplayRequests, 1,
                            reinterpret_cast<DWORD_PTR>(requests));
    const int expected = stationCount + 1;  // and the "Add New Digital Level" entry
    const auto filled = [&] {
        return !::GetDlgItem(viewWindow, IDC_VIEW_ANIMATION) &&
               ListView_GetItemCount(list) == expected;
    };
    while (!filled()) {
        MSG message;
        if (!::PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE)) {
            if (MillisecondsSince(start) > kGiveUpMilliseconds)
                break;
            ::MsgWaitForMultipleObjectsEx(0, nullptr, 100, QS_ALLINPUT, MWMO_INPUTAVAILABLE);
            continue;
        }
        const LONGLONG begin = Ticks();
        if (!browser->TranslateThroughView(message)) {
            ::TranslateMessage(&message);
            ::DispatchMessageW(&message);
        }
        const double spent = MillisecondsSince(begin);
        run.longestMessage = std::max(run.longestMessage, spent);
        if (message.message == g_registeredMessages.getEnumIdList)
            run.fillMessage += spent;
        ++run.messages;
    }
    run.filled = MillisecondsSince(start);
    run.complete = filled();
    if (requests)
        ::RemoveWindowSubclass(viewWindow, &CountDisplayRequests, 1);

    // The texts come on demand: this is what painting every item asks for.
    const int count = ListView_GetItemCount(list);
    for (int index = 0; index < count; ++index) {
        wchar_t text[MAX_PATH] = {};
        ListView_GetItemText(list, index, 0, text, ARRAYSIZE(text));
        if (!text[0])
            ++run.emptyTexts;
    }
    run.texts = MillisecondsSince(start);

    if (keep)
        *keep = browser;
    else
        browser->Close();
    return run;
}

// Where the fill message's time goes, on a filled view: the view's own sort (a click on the
// column, after the list was put in a random order) against the list control's sort with a
// comparison that costs nothing, and every item's image asked for once.
struct Breakdown {
    double enumeration = 0;  // the fill thread's work: EnumObjects, here on this thread
    double viewSort = 0;
    double plainSort = 0;
    double images = 0;
};

int CALLBACK ShuffledOrder(LPARAM first, LPARAM second, LPARAM) {
    // A fixed scramble of the identifiers' addresses: an order unrelated to the names.
    const auto scramble = [](LPARAM value) {
        uint64_t mixed = static_cast<uint64_t>(value) + 0x9E3779B97F4A7C15ull;
        mixed = (mixed ^ (mixed >> 30)) * 0xBF58476D1CE4E5B9ull;
        mixed = (mixed ^ (mixed >> 27)) * 0x94D049BB133111EBull;
        return mixed ^ (mixed >> 31);
    };
    const uint64_t a = scramble(first);
    const uint64_t b = scramble(second);
    return a < b ? -1 : (a > b ? 1 : 0);
}

double ClickColumnSorted(const CExplorerWindow& browser) {
    const HWND list = ListOf(browser);
    ListView_SortItems(list, &ShuffledOrder, 0);
    NMLISTVIEW click{};
    click.hdr = NMHDR{list, IDC_VIEW_LIST, static_cast<UINT>(LVN_COLUMNCLICK)};
    click.iItem = -1;
    click.iSubItem = 0;
    const LONGLONG start = Ticks();
    ::SendMessageW(browser.ViewWindow(), WM_NOTIFY, IDC_VIEW_LIST,
                   reinterpret_cast<LPARAM>(&click));
    return MillisecondsSince(start);
}

// The enumeration the fill thread asks for, timed on its own; -1 when it fails.
double MeasureEnumeration(int stationCount) {
    TopFolderView made;
    if (FAILED(MakeTopFolderView(made)))
        return -1;
    const LONGLONG start = Ticks();
    ComPtr<IEnumIDList> enumerator;
    if (FAILED(
            made.folder->EnumObjects(nullptr, SHCONTF_FOLDERS | SHCONTF_NONFOLDERS, &enumerator)) ||
        !enumerator)
        return -1;
    const double milliseconds = MillisecondsSince(start);
    int count = 0;
    PITEMID_CHILD item = nullptr;
    while (enumerator->Next(1, &item, nullptr) == S_OK) {
        UniqueChildPidl owned(item);
        ++count;
    }
    return count == stationCount ? milliseconds : -1;
}

Breakdown MeasureBreakdown(const CExplorerWindow& browser, int stationCount) {
    Breakdown breakdown;
    breakdown.enumeration = MeasureEnumeration(stationCount);
    const HWND list = ListOf(browser);
    // Two clicks: the first reverses the process-wide sort direction, the second restores it.
    breakdown.viewSort = (ClickColumnSorted(browser) + ClickColumnSorted(browser)) / 2;

    ListView_SortItems(list, &ShuffledOrder, 0);
    LONGLONG start = Ticks();
    ListView_SortItems(
        list,
        [](LPARAM first, LPARAM second, LPARAM) -> int {
            return first < second ? -1 : (first > second ? 1 : 0);
        },
        0);
    breakdown.plainSort = MillisecondsSince(start);

    start = Ticks();
    const int count = ListView_GetItemCount(list);
    for (int index = 0; index < count; ++index) {
        LVITEMW item{};
        item.mask = LVIF_IMAGE;
        item.iItem = index;
        ListView_GetItem(list, &item);
    }
    breakdown.images = MillisecondsSince(start);
    return breakdown;
}

double Median(std::vector<double> values) {
    std::sort(values.begin(), values.end());
    const size_t middle = values.size() / 2;
    return values.size() % 2 ? values[middle] : (values[middle - 1] + values[middle]) / 2;
}

double Worst(const std::vector<double>& values) {
    return *std::max_element(values.begin(), values.end());
}

struct SizeFigures {
    int stations = 0;
    std::vector<double> createCall, filled, texts, longestMessage, fillMessage;
    std::vector<double> textsAlone;  // the text requests after the fill, per run
    int messages = 0;
    Breakdown breakdown;
    DisplayRequests requestsDuringFill;
    BareList plainList;
    BareList subclassedList;
    double roundTrip = 0;  // microseconds, right after the breakdown
};

void PrintMachine(const Settings& settings) {
    wchar_t processor[128] = L"unknown processor";
    DWORD size = sizeof processor;
    (void)::RegGetValueW(HKEY_LOCAL_MACHINE, L"HARDWARE\\DESCRIPTION\\System\\CentralProcessor\\0",
                         L"ProcessorNameString", RRF_RT_REG_SZ, nullptr, processor, &size);
    SYSTEM_INFO system{};
    ::GetNativeSystemInfo(&system);
    using WineVersion = const char*(__cdecl*)();
    const auto wineVersion = reinterpret_cast<WineVersion>(reinterpret_cast<void*>(
        ::GetProcAddress(::GetModuleHandleW(L"ntdll.dll"), "wine_get_version")));
    printf("machine: %ls, %lu logical processors, %s%s\n", processor,
           static_cast<unsigned long>(system.dwNumberOfProcessors),
           wineVersion ? "under Wine " : "on Windows", wineVersion ? wineVersion() : "");
    printf(
        "browser window %s, view mode %s; %d timed runs per size after one that is not "
        "counted\n\n",
        settings.visible ? "visible" : "hidden",
        settings.viewMode == FVM_DETAILS ? "details" : "large icons", settings.repetitions);
}

bool ParseArguments(int argc, char** argv, Settings& settings) {
    for (int index = 1; index < argc; ++index) {
        const std::string argument = argv[index];
        if (argument == "--hidden") {
            settings.visible = false;
        } else if (argument == "--details") {
            settings.viewMode = FVM_DETAILS;
        } else if (argument == "--repetitions" && index + 1 < argc) {
            settings.repetitions = atoi(argv[++index]);
            if (settings.repetitions < 1)
                return false;
        } else {
            return false;
        }
    }
    return true;
}

}  // namespace

int main(int argc, char** argv) {
    Settings settings;
    if (!ParseArguments(argc, argv, settings)) {
        fputs(kUsage, stderr);
        return 2;
    }
    if (FAILED(::OleInitialize(nullptr)))
        return 1;
    const INITCOMMONCONTROLSEX controls{sizeof controls, ICC_WIN95_CLASSES | ICC_ANIMATE_CLASS};
    ::InitCommonControlsEx(&controls);
    RegisterWindowMessages();
    if (!BuildSharedIconLists(ThisModule())) {
        fputs("the icon lists could not be built\n", stderr);
        return 1;
    }
    PrintMachine(settings);

    std::vector<SizeFigures> sizes;
    bool failed = false;
    for (int stations : {10, 100, 1000}) {
        ScratchStore store;
        if (!store.Ready() || !AddStations(stations)) {
            fprintf(stderr, "the scratch store of %d stations could not be made\n", stations);
            return 1;
        }
        SizeFigures figures;
        figures.stations = stations;
        (void)MeasureOnce(stations, settings);  // first views in the process load what they use
        for (int repetition = 0; repetition < settings.repetitions; ++repetition) {
            const Run run = MeasureOnce(stations, settings);
            if (!run.complete || run.emptyTexts) {
                fprintf(stderr, "%d stations, run %d: %s, %d empty texts\n", stations,
                        repetition + 1, run.complete ? "filled" : "NOT filled", run.emptyTexts);
                failed = true;
            }
            figures.createCall.push_back(run.createCall);
            figures.filled.push_back(run.filled);
            figures.texts.push_back(run.texts);
            figures.textsAlone.push_back(run.texts - run.filled);
            figures.longestMessage.push_back(run.longestMessage);
            figures.fillMessage.push_back(run.fillMessage);
            figures.messages = std::max(figures.messages, run.messages);
        }
        ComPtr<CExplorerWindow> browser;
        if (MeasureOnce(stations, settings, &browser, &figures.requestsDuringFill).complete &&
            browser) {
            figures.breakdown = MeasureBreakdown(*browser.Get(), stations);
            figures.roundTrip = ServerRoundTripMicroseconds(browser->Window());
        } else {
            fprintf(stderr, "%d stations: the view for the breakdown was not filled\n", stations);
            failed = true;
        }
        if (browser)
            browser->Close();
        figures.plainList = MeasureBareList(stations + 1, false, settings.visible,
                                            settings.viewMode == FVM_DETAILS);
        figures.subclassedList =
            MeasureBareList(stations + 1, true, settings.visible, settings.viewMode == FVM_DETAILS);
        // Late posts for windows that are gone find nobody; let them go.
        MSG message;
        while (::PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE))
            ::DispatchMessageW(&message);
        sizes.push_back(std::move(figures));
    }

    printf("%8s | %15s | %18s | %18s | %18s | %17s\n", "", "create call (ms)", "filled (ms)",
           "all texts (ms)", "longest msg (ms)", "fill message (ms)");
    printf("%8s | %15s | %8s %9s | %8s %9s | %8s %9s | %8s %8s\n", "stations", "median", "median",
           "worst", "median", "worst", "median", "worst", "median", "worst");
    for (const SizeFigures& figures : sizes) {
        printf("%8d | %15.1f | %8.1f %9.1f | %8.1f %9.1f | %8.1f %9.1f | %8.1f %8.1f\n",
               figures.stations, Median(figures.createCall), Median(figures.filled),
               Worst(figures.filled), Median(figures.texts), Worst(figures.texts),
               Median(figures.longestMessage), Worst(figures.longestMessage),
               Median(figures.fillMessage), Worst(figures.fillMessage));
    }
    const SizeFigures& hundred = sizes[1];
    const SizeFigures& thousand = sizes[2];
    const auto growth = [&](const std::vector<double> SizeFigures::*figure) {
        return Median(thousand.*figure) / Median(hundred.*figure);
    };
    printf(
        "\ngrowth from 100 to 1,000 stations (medians): filled x%.1f, all texts x%.1f, longest "
        "message x%.1f, fill message x%.1f\n",
        growth(&SizeFigures::filled), growth(&SizeFigures::texts),
        growth(&SizeFigures::longestMessage), growth(&SizeFigures::fillMessage));

    printf(
        "\nwhere the time goes (ms; fill message and texts alone are the runs' medians, the rest "
        "one more view per size):\n");
    printf("%8s | %11s | %13s | %15s | %17s | %11s | %11s | %12s | %s\n", "stations", "enumeration",
           "fill message", "view's own sort", "plain-order sort", "texts alone", "all images",
           "messages max", "texts / images asked during the fill");
    for (const SizeFigures& figures : sizes) {
        printf("%8d | %11.1f | %13.1f | %15.1f | %17.1f | %11.1f | %11.1f | %12d | %d / %d\n",
               figures.stations, figures.breakdown.enumeration, Median(figures.fillMessage),
               figures.breakdown.viewSort, figures.breakdown.plainSort, Median(figures.textsAlone),
               figures.breakdown.images, figures.messages, figures.requestsDuringFill.texts,
               figures.requestsDuringFill.images);
    }

    printf(
        "\nthe same inserts and texts on a bare list control, plain / subclassed (ms), and one "
        "call answered by Wine's server (GetPropW, us):\n");
    printf("%8s | %21s | %21s | %10s\n", "items", "inserts", "all texts", "round trip");
    for (const SizeFigures& figures : sizes) {
        printf("%8d | %9.1f / %9.1f | %9.1f / %9.1f | %10.1f\n", figures.stations + 1,
               figures.plainList.inserts, figures.subclassedList.inserts, figures.plainList.texts,
               figures.subclassedList.texts, figures.roundTrip);
    }
    ::OleUninitialize();
    return failed ? 1 : 0;
}
