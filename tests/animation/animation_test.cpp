// The "looking for instruments" animation in a real animation control on a virtual display: the
// committed file opens and plays with its background transparent, and damaged copies are refused.
#include <windows.h>
#include <commctrl.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "support/unique_resource.h"

namespace {

constexpr COLORREF kKeyColour = RGB(255, 0, 255);  // the file's background, never to be shown
constexpr int kWidth = 120, kHeight = 100;         // the control; the 80 by 64 frame is centred
int g_startNotifications = 0;

// The control fills its transparent pixels with the brush its parent gives for static controls.
LRESULT CALLBACK ParentProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
    if (message == WM_CTLCOLORSTATIC)
        return reinterpret_cast<LRESULT>(::GetSysColorBrush(COLOR_WINDOW));
    if (message == WM_COMMAND && HIWORD(wParam) == ACN_START)
        ++g_startNotifications;
    return ::DefWindowProcW(window, message, wParam, lParam);
}

void PumpMessagesFor(DWORD milliseconds) {
    for (const DWORD start = ::GetTickCount(); ::GetTickCount() - start < milliseconds;
         ::Sleep(10)) {
        MSG message;
        while (::PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE))
            ::DispatchMessageW(&message);
    }
}

// The file as Wine sees it: the source tree's path on drive Z:, which maps the host's root.
std::filesystem::path AnimationFile() {
    const std::string hostPath = LV_SEARCH_ANIMATION_PATH;
    return std::filesystem::path((hostPath.front() == '/' ? "Z:" : "") + hostPath).make_preferred();
}

class AnimationControl : public ::testing::Test {
protected:
    void SetUp() override {
        const INITCOMMONCONTROLSEX controls{sizeof controls, ICC_ANIMATE_CLASS};
        ASSERT_TRUE(::InitCommonControlsEx(&controls));
        WNDCLASSW parentClass{};
        parentClass.lpfnWndProc = ParentProc;
        parentClass.lpszClassName = L"LVAnimationTestParent";
        ::RegisterClassW(&parentClass);  // already there after the first test
        parent_.reset(::CreateWindowExW(0, parentClass.lpszClassName, L"", WS_POPUP | WS_VISIBLE,
                                        100, 100, kWidth + 40, kHeight + 40, nullptr, nullptr,
                                        nullptr, nullptr));
        control_.reset(
            ::CreateWindowExW(0, ANIMATE_CLASSW, nullptr,
                              WS_CHILD | WS_VISIBLE | ACS_CENTER | ACS_TRANSPARENT | ACS_AUTOPLAY,
                              20, 20, kWidth, kHeight, parent_.get(), nullptr, nullptr, nullptr));
        ASSERT_TRUE(control_);
        g_startNotifications = 0;
    }
    BOOL Open(const std::filesystem::path& path) {
        return Animate_Open(control_.get(), path.c_str());
    }
    std::vector<COLORREF> Pixels() const {  // what the control shows now, row by row
        const HDC dc = ::GetDC(control_.get());
        std::vector<COLORREF> pixels;
        for (int y = 0; y < kHeight; ++y)
            for (int x = 0; x < kWidth; ++x)
                pixels.push_back(::GetPixel(dc, x, y));
        ::ReleaseDC(control_.get(), dc);
        return pixels;
    }

    UniqueWindow parent_;
    UniqueWindow control_;  // destroyed first, which stops its player thread
};

TEST_F(AnimationControl, PlaysWithTheWindowColourAroundTheDrawingAndMovesBetweenFrames) {
    ASSERT_TRUE(Open(AnimationFile()));
    PumpMessagesFor(250);
    // The notification that the damaged copies below must not give.
    EXPECT_EQ(1, g_startNotifications);
    const std::vector<COLORREF> earlier = Pixels();
    PumpMessagesFor(350);
    const std::vector<COLORREF> later = Pixels();
    EXPECT_NE(earlier, later);
    for (const std::vector<COLORREF>& pixels : {earlier, later}) {
        EXPECT_EQ(0, std::count(pixels.begin(), pixels.end(), kKeyColour));
        const int frameTopLeft = (kHeight - 64) / 2 * kWidth + (kWidth - 80) / 2;
        EXPECT_EQ(::GetSysColor(COLOR_WINDOW), pixels[frameTopLeft]);
    }
}

// Wine does not compare the bitmap header's width, height or depth with the frames (it plays
// such a file as it can), so only damage to the file's structure is refused there.
TEST_F(AnimationControl, RefusesDamagedCopiesOfTheFile) {
    std::ifstream stream(AnimationFile(), std::ios::binary);
    const std::vector<char> good{std::istreambuf_iterator<char>(stream),
                                 std::istreambuf_iterator<char>()};
    ASSERT_GT(good.size(), 2000u);
    const struct {
        const char* name;
        size_t keptBytes;   // the copy is cut short here
        const char* field;  // or the value after this chunk name, at this offset, is replaced
        size_t offset;
        uint32_t value;
    } cases[] = {
        {"cut short among the frames", good.size() / 2, nullptr, 0, 0},
        {"cut short in the header", 100, nullptr, 0, 0},
        {"first frame's size past the end", good.size(), "00dc", 4, 0x01000000},
        {"more frames announced than stored", good.size(), "avih", 8 + 16, 17},
        {"frames that need a codec", good.size(), "strh", 8 + 4, 0x34363248},  // 'H264'
    };
    const auto path = std::filesystem::temp_directory_path() / "lv-damaged-animation.avi";
    for (const auto& damage : cases) {
        SCOPED_TRACE(damage.name);
        std::vector<char> bytes(good.begin(), good.begin() + damage.keptBytes);
        if (damage.field) {
            const auto at = std::search(bytes.begin(), bytes.end(), damage.field, damage.field + 4);
            std::memcpy(&*(at + damage.offset), &damage.value, sizeof damage.value);
        }
        std::ofstream(path, std::ios::binary)
            .write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        EXPECT_FALSE(Open(path));
        PumpMessagesFor(200);
        EXPECT_EQ(0, g_startNotifications);
        Animate_Close(control_.get());  // lets the file go even where a copy was wrongly taken
    }
    std::filesystem::remove(path);
}

}  // namespace
