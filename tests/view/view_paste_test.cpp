// Pasting stations through the view's Paste command, with real blocks on the clipboard: a
// thousand into a thousand while the view answers messages, the limits and the names the store
// could not keep (refused whole, with a message, nothing written), and a station another program
// named with a backslash.
#include "tests/view/view_fixture.h"

#include <atomic>
#include <cstring>
#include <set>

#include "stations/portable/station_list_format.h"
#include "support/clipboard_formats.h"
#include "support/registry_value.h"
#include "tests/stations/store_refusal.h"

namespace {

using Names = std::vector<std::wstring>;

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

class PasteTest : public ShellViewTest {
protected:
    // The texts of the message boxes shown so far.
    std::vector<std::wstring> Messages() const {
        std::vector<std::wstring> texts;
        for (const auto& box : user_.MessageBoxes())
            texts.push_back(box.text);
        return texts;
    }
};

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
    EXPECT_TRUE(Messages().empty());
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

TEST_F(PasteTest, BlocksOverTheLimitsAreRefusedWholeWithAMessage) {
    AddStationOfModel(L"Kept");
    Names many;
    for (int number = 1; number <= 1001; ++number)
        many.push_back(LevelName(number));
    const std::wstring tooMany =
        L"Nothing was pasted: the clipboard holds more digital levels than can be pasted at once "
        L"(at most 1000, in 1024 KB).";
    const struct {
        const char* what;
        std::vector<uint8_t> block;
        size_t padding;
    } cases[] = {
        {"1,001 stations", SerializeStationRecords(StationsNamed(many)), 0},
        {"a count over the limit with fewer records",
         [] {
             std::vector<uint8_t> block = SerializeStationRecords(StationsNamed({L"A"}));
             block[0] = 0xE9;  // 1001
             block[1] = 0x03;
             return block;
         }(),
         0},
        {"one station in a block of 1 MiB and a byte",
         SerializeStationRecords(StationsNamed({L"A"})), 1024 * 1024},
    };
    CExplorerWindow& browser = Open();
    for (const auto& test : cases) {
        PutBlockOnClipboard(test.block, test.padding);
        const size_t before = user_.MessageBoxes().size();
        EXPECT_EQ(S_OK, Command(browser, 1282)) << test.what;
        const auto boxes = user_.MessageBoxes();
        ASSERT_EQ(before + 1, boxes.size()) << test.what;
        EXPECT_EQ(tooMany, boxes.back().text) << test.what;
        EXPECT_EQ(browser.ViewWindow(), boxes.back().owner) << test.what;
        EXPECT_EQ(static_cast<UINT>(MB_ICONERROR), boxes.back().style) << test.what;
        EXPECT_EQ(Names{L"Kept"}, ListStationNames()) << test.what;
    }
    // At the limit itself the block goes in.
    many.pop_back();
    PutBlockOnClipboard(SerializeStationRecords(StationsNamed(many)));
    EXPECT_EQ(S_OK, Command(browser, 1282));
    EXPECT_EQ(1001u, ListStationNames().size());
}

TEST_F(PasteTest, ABlockWithANameTheStoreCannotKeepWritesNothingAndNamesIt) {
    AddStationOfModel(L"Kept");
    Station longPort = Named(L"Long port");
    longPort.Port = std::wstring(260, L'P');
    const struct {
        Station station;
        std::wstring quoted;  // as the message quotes it
    } cases[] = {
        {Named(L""), L""},
        {Named(L"Site\\North"), L"Site\\North"},
        {Named(L"c/d"), L"c/d"},
        {Named(L"say \"x\""), L"say \"x\""},
        {Named(L"st*r"), L"st*r"},
        {Named(std::wstring(260, L'L')), std::wstring(64, L'L') + L"\x2026"},
        {longPort, L"Long port"},
    };
    CExplorerWindow& browser = Open();
    for (const auto& test : cases) {
        PutBlockOnClipboard(
            SerializeStationRecords({Named(L"Good"), test.station, Named(L"Fine")}));
        EXPECT_EQ(S_OK, Command(browser, 1282));
        ASSERT_FALSE(user_.MessageBoxes().empty());
        EXPECT_EQ(L"Nothing was pasted: digital level 2 on the clipboard, '" + test.quoted +
                      L"', cannot be stored as it is. A name must not be empty, be longer than "
                      L"259 characters or contain a backslash, slash, double quote or asterisk, "
                      L"and no setting may be longer than 259 characters.",
                  user_.MessageBoxes().back().text);
        EXPECT_EQ(Names{L"Kept"}, ListStationNames()) << test.quoted;
    }
    EXPECT_EQ(std::size(cases), user_.MessageBoxes().size());

    // A record cut short ends the block: the complete ones before it are pasted.
    std::vector<uint8_t> block = SerializeStationRecords({Named(L"Good"), Named(L"Fine")});
    std::vector<uint8_t> liar = SerializeStationRecords({Named(L"Liar")});
    liar.resize(liar.size() / 2);
    block.insert(block.end(), liar.begin(), liar.end());
    PutBlockOnClipboard(block);
    EXPECT_EQ(S_OK, Command(browser, 1282));
    EXPECT_EQ((Names{L"Kept", L"Good", L"Fine"}), ListStationNames());
    EXPECT_EQ((Names{kEntry, L"Fine", L"Good", L"Kept"}), Texts(browser));
}

TEST_F(PasteTest, ALongNamePastedOverItselfIsRefusedRatherThanCut) {
    // 255 characters fit the store; "Copy of " in front would not. (The view's own Copy cannot
    // carry a name this long yet: the data object cuts the item's path at 260 characters.)
    const std::wstring name(255, L'N');
    AddStationOfModel(name);
    CExplorerWindow& browser = Open();
    PutBlockOnClipboard(SerializeStationRecords({Named(name)}));
    EXPECT_EQ(S_OK, Command(browser, 1282));
    ASSERT_EQ(1u, user_.MessageBoxes().size());
    EXPECT_EQ(L"Nothing was pasted: the digital level '" + std::wstring(64, L'N') +
                  L"\x2026' already exists, and the name of its copy would be longer than 259 "
                  L"characters. Give it a shorter name and copy it again.",
              user_.MessageBoxes().front().text);
    EXPECT_EQ(Names{name}, ListStationNames());
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
