// The view's Paste with other programs' blocks on the clipboard: a thousand into a thousand while
// the view answers, blocks refused whole, a backslash in a stored name, a store that refuses.
#include "tests/view/view_fixture.h"

#include <atomic>
#include <cstring>
#include <set>

#include "stations/portable/station_list_format.h"
#include "support/clipboard_formats.h"
#include "support/registry_value.h"
#include "tests/stations/store_refusal.h"

namespace {

// Puts a station-list block on the clipboard as another program would, without a data object.
void PutBlockOnClipboard(const std::vector<uint8_t>& block, size_t padding = 0) {
    ASSERT_TRUE(::OpenClipboard(nullptr));
    ::EmptyClipboard();
    UniqueHGlobal memory(::GlobalAlloc(GMEM_MOVEABLE | GMEM_ZEROINIT, block.size() + padding));
    ASSERT_TRUE(memory);
    {
        GlobalLockGuard lock(memory.get());
        std::memcpy(lock.data(), block.data(), block.size());
    }
    if (::SetClipboardData(RegisteredFormat(ClipboardFormat::StationList), memory.get()))
        (void)memory.release();  // the clipboard's now
    ::CloseClipboard();
}

std::vector<Station> StationsNamed(const Names& names) {
    std::vector<Station> stations;
    for (const std::wstring& name : names)
        stations.push_back(Named(name));
    return stations;
}

std::wstring LevelName(int number) {
    wchar_t name[32];
    swprintf(name, ARRAYSIZE(name), L"Level %04d", number);
    return name;
}

// A top-level window of this thread that counts the station list's change broadcasts.
class BroadcastCounter {
public:
    BroadcastCounter() {
        WNDCLASSW windowClass{};
        windowClass.lpfnWndProc = &Procedure;
        windowClass.hInstance = ::GetModuleHandleW(nullptr);
        windowClass.lpszClassName = L"LV paste test broadcast counter";
        (void)::RegisterClassW(&windowClass);  // registered already by an earlier test
        window_.reset(::CreateWindowExW(WS_EX_TOOLWINDOW, windowClass.lpszClassName, L"", WS_POPUP,
                                        0, 0, 0, 0, nullptr, nullptr, windowClass.hInstance,
                                        nullptr));
        EXPECT_TRUE(window_);
        ::SetWindowLongPtrW(window_.get(), GWLP_USERDATA, reinterpret_cast<LONG_PTR>(&count_));
    }
    int Count() const { return count_; }

private:
    static LRESULT CALLBACK Procedure(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
        if (message != 0 && message == g_registeredMessages.globalNotify) {
            ++*reinterpret_cast<int*>(::GetWindowLongPtrW(window, GWLP_USERDATA));
            return 0;
        }
        return ::DefWindowProcW(window, message, wParam, lParam);
    }

    int count_ = 0;
    UniqueWindow window_;
};

class PasteTest : public ShellViewTest {};

TEST_F(PasteTest, AThousandIntoAThousandWhileTheViewAnswersMessagesWithOneBroadcast) {
    Names stored;
    for (int number = 1; number <= 1000; ++number)
        stored.push_back(LevelName(number));
    ASSERT_EQ(S_OK, AddStations(StationsNamed(stored)));
    // The block names 999 of them, and the first one twice.
    Names pasted(stored.begin(), stored.end() - 1);
    pasted.push_back(stored.front());
    PutBlockOnClipboard(SerializeStationRecords(StationsNamed(pasted)));
    CExplorerWindow& browser = Open();
    BroadcastCounter broadcasts;

    // Another thread asks the view window for an answer again and again; the ten seconds are a
    // watchdog, not a measure.
    const HWND view = browser.ViewWindow();
    std::atomic<bool> pasting{false};
    std::atomic<bool> stop{false};
    std::atomic<int> answeredWhilePasting{0};
    std::atomic<int> unanswered{0};
    UniqueHandle proberDone(::CreateEventW(nullptr, TRUE, FALSE, nullptr));
    std::thread prober([&, done = proberDone.get()] {
        while (!stop) {
            DWORD_PTR result = 0;
            if (!::SendMessageTimeoutW(view, WM_NULL, 0, 0, SMTO_NORMAL, 10000, &result))
                ++unanswered;
            else if (pasting)
                ++answeredWhilePasting;
        }
        ::SetEvent(done);
    });
    ComPtr<IOleCommandTarget> target;
    ASSERT_EQ(S_OK, browser.View()->QueryInterface(IID_PPV_ARGS(&target)));
    pasting = true;
    const HRESULT result = target->Exec(&CGID_Explorer, 1282, 0, nullptr, nullptr);
    pasting = false;
    stop = true;
    // The prober may be waiting for an answer: answer until it has ended.
    while (::WaitForSingleObject(proberDone.get(), 0) != WAIT_OBJECT_0)
        browser.PumpMessages(10);
    prober.join();

    EXPECT_EQ(S_OK, result);
    EXPECT_GT(answeredWhilePasting.load(), 0) << "the view did not answer while it pasted";
    EXPECT_EQ(0, unanswered.load());
    EXPECT_TRUE(user_.MessageBoxes().empty());
    std::set<std::wstring> expected(stored.begin(), stored.end());
    for (int number = 1; number < 1000; ++number)
        expected.insert(L"Copy of " + LevelName(number));
    expected.insert(L"Copy of Copy of " + LevelName(1));
    const Names names = ListStationNames();
    EXPECT_EQ(2000u, names.size());
    EXPECT_EQ(expected, std::set<std::wstring>(names.begin(), names.end()));
    WaitForFill(browser);
    browser.PumpMessages(100);
    EXPECT_EQ(2001u, Texts(browser).size());
    EXPECT_EQ(1, broadcasts.Count());
}

// Each refused block writes nothing and says why in one box in the view. (The view's own Copy
// cannot carry a name of 255 characters yet: the data object cuts the item's path at 260.)
TEST_F(PasteTest, BlocksOverTheLimitsOrWithANameTheStoreCannotKeepAreRefusedWholeWithAMessage) {
    const std::wstring longName(255, L'N');  // fits the store; "Copy of " in front would not
    AddStationsOfModel({L"Kept", longName.c_str()});
    const Names stored{L"Kept", longName};
    Names many;
    for (int number = 1; number <= 1001; ++number)
        many.push_back(LevelName(number));
    std::vector<uint8_t> countOverLimit = SerializeStationRecords(StationsNamed({L"A"}));
    countOverLimit[0] = 0xE9;  // 1001
    countOverLimit[1] = 0x03;
    const std::wstring tooMany =
        L"Nothing was pasted: the clipboard holds more digital levels than can be pasted at once "
        L"(at most 1000, in 1024 KB).";
    // The second of three stations; the message quotes its name cut to 64 characters.
    const auto unstorable = [](const Station& station, const std::wstring& quoted) {
        return std::pair{SerializeStationRecords({Named(L"Good"), station, Named(L"Fine")}),
                         L"Nothing was pasted: digital level 2 on the clipboard, '" + quoted +
                             L"', cannot be stored as it is. A name must not be empty, be longer "
                             L"than 259 characters or contain a backslash, slash, double quote or "
                             L"asterisk, and no setting may be longer than 259 characters."};
    };
    Station longPort = Named(L"Long port");
    longPort.Port = std::wstring(260, L'P');
    const struct {
        const char* what;
        std::pair<std::vector<uint8_t>, std::wstring> blockAndText;
        size_t padding = 0;
    } cases[] = {
        {"1,001 stations", {SerializeStationRecords(StationsNamed(many)), tooMany}},
        {"a count over the limit with fewer records", {countOverLimit, tooMany}},
        {"one station in a block of 1 MiB and a byte",
         {SerializeStationRecords(StationsNamed({L"A"})), tooMany},
         1024 * 1024},
        {"an empty name", unstorable(Named(L""), L"")},
        {"a backslash", unstorable(Named(L"Site\\North"), L"Site\\North")},
        {"a slash", unstorable(Named(L"c/d"), L"c/d")},
        {"a double quote", unstorable(Named(L"say \"x\""), L"say \"x\"")},
        {"an asterisk", unstorable(Named(L"st*r"), L"st*r")},
        {"260 characters",
         unstorable(Named(std::wstring(260, L'L')), std::wstring(64, L'L') + L"\x2026")},
        {"a port of 260 characters", unstorable(longPort, L"Long port")},
        {"a name of 255 pasted over itself",
         {SerializeStationRecords({Named(longName)}),
          L"Nothing was pasted: the digital level '" + std::wstring(64, L'N') +
              L"\x2026' already exists, and the name of its copy would be longer than 259 "
              L"characters. Give it a shorter name and copy it again."}},
    };
    CExplorerWindow& browser = Open();
    for (const auto& test : cases) {
        SCOPED_TRACE(test.what);
        PutBlockOnClipboard(test.blockAndText.first, test.padding);
        const size_t before = user_.MessageBoxes().size();
        EXPECT_EQ(S_OK, Command(browser, 1282));
        const auto boxes = user_.MessageBoxes();
        ASSERT_EQ(before + 1, boxes.size());
        EXPECT_EQ(test.blockAndText.second, boxes.back().text);
        EXPECT_EQ(browser.ViewWindow(), boxes.back().owner);
        EXPECT_EQ(static_cast<UINT>(MB_ICONERROR), boxes.back().style);
        EXPECT_EQ(stored, ListStationNames());
    }

    // A record cut short ends the block: the complete ones before it are pasted.
    std::vector<uint8_t> block = SerializeStationRecords({Named(L"Good"), Named(L"Fine")});
    std::vector<uint8_t> liar = SerializeStationRecords({Named(L"Liar")});
    liar.resize(liar.size() / 2);
    block.insert(block.end(), liar.begin(), liar.end());
    PutBlockOnClipboard(block);
    EXPECT_EQ(S_OK, Command(browser, 1282));
    EXPECT_EQ((Names{L"Kept", longName, L"Good", L"Fine"}), ListStationNames());
    EXPECT_EQ((Names{kEntry, L"Fine", L"Good", L"Kept", longName}), Texts(browser));
    // At the limit itself the block goes in.
    many.pop_back();
    PutBlockOnClipboard(SerializeStationRecords(StationsNamed(many)));
    EXPECT_EQ(S_OK, Command(browser, 1282));
    EXPECT_EQ(1004u, ListStationNames().size());
}

TEST_F(PasteTest, AStationNamedWithABackslashIsNotListedAsAnotherAndActsOnNone) {
    ASSERT_EQ(ERROR_SUCCESS,
              WriteStringValue(StationKey(L"Station 0").get(), L"Name", L"Site\\North"));
    AddStationOfModel(L"Site");
    CExplorerWindow& browser = Open();
    EXPECT_EQ((Names{kEntry, L"Site"}), Texts(browser));
    Station found = Named(L"Site");
    wchar_t key[260] = {};
    DWORD capacity = ARRAYSIZE(key);
    ASSERT_EQ(S_OK, FindStation(found, key, &capacity));
    EXPECT_STREQ(L"Station 1", key);
    // Deleting the listed "Site" deletes that station and leaves the other program's key alone.
    Select(browser, {1});
    EXPECT_EQ(S_OK, Command(browser, 1288));
    EXPECT_TRUE(ListStationNames().empty());
    std::wstring other;
    EXPECT_EQ(ERROR_SUCCESS, ReadStringValue(StationKey(L"Station 0").get(), L"Name", 520, other));
    EXPECT_EQ(L"Site\\North", other);
    EXPECT_EQ(Names{kEntry}, Texts(browser));
}

TEST_F(PasteTest, AStoreThatRefusesTheWriteNamesTheStationsItWouldHaveAdded) {
    AddStationOfModel(L"A");
    CExplorerWindow& browser = Open();
    PutBlockOnClipboard(SerializeStationRecords(StationsNamed({L"A", L"B"})));
    {
        WriteRefusingKey locked;
        EXPECT_EQ(S_OK, Command(browser, 1282));
    }
    ASSERT_EQ(1u, user_.MessageBoxes().size());
    EXPECT_EQ(
        L"Nothing was pasted: these digital levels could not be stored:\r\n'Copy of A'\r\n"
        L"'B'\r\n\r\n" +
            SystemMessageText(ERROR_ACCESS_DENIED),
        user_.MessageBoxes()[0].text);
    EXPECT_EQ(Names{L"A"}, ListStationNames());
    // The same paste once the store takes writes again.
    EXPECT_EQ(S_OK, Command(browser, 1282));
    EXPECT_EQ((Names{L"A", L"Copy of A", L"B"}), ListStationNames());
}

}  // namespace
