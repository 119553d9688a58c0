// What Windows refuses in a file name: its devices and its forbidden characters.
#include <gtest/gtest.h>

#include "support/portable/windows_file_names.h"

#include <string>

namespace {

std::string Narrow(WideStringView text) {
    std::string narrow;
    for (const WideChar character : text)
        narrow.push_back(character < 0x80 ? static_cast<char>(character) : '?');
    return narrow;
}

TEST(WindowsFileNames, DeviceNamesAreFoundWithAnyExtensionCaseOrTrailingSpace) {
    const struct {
        const WideChar* name;
        const WideChar* device;  // empty: a file
    } cases[] = {
        {WIDE_TEXT("CON"), WIDE_TEXT("CON")},
        {WIDE_TEXT("con.lv"), WIDE_TEXT("CON")},
        {WIDE_TEXT("Aux.lv"), WIDE_TEXT("AUX")},
        {WIDE_TEXT("nul.tar.gz"), WIDE_TEXT("NUL")},
        {WIDE_TEXT("PrN.hvr"), WIDE_TEXT("PRN")},
        {WIDE_TEXT("AUX .lv"), WIDE_TEXT("AUX")},
        {WIDE_TEXT("NUL  "), WIDE_TEXT("NUL")},
        {WIDE_TEXT("COM1.txt"), WIDE_TEXT("COM1")},
        {WIDE_TEXT("com9"), WIDE_TEXT("COM9")},
        {WIDE_TEXT("COM0.lv"), WIDE_TEXT("COM0")},
        {WIDE_TEXT("lpt5.hvr"), WIDE_TEXT("LPT5")},
        {WIDE_TEXT("COM\u00B9.lv"), WIDE_TEXT("COM\u00B9")},
        {WIDE_TEXT("lpt\u00B2"), WIDE_TEXT("LPT\u00B2")},
        {WIDE_TEXT("Lpt\u00B3.x"), WIDE_TEXT("LPT\u00B3")},
        {WIDE_TEXT("CONIN$"), WIDE_TEXT("CONIN$")},
        {WIDE_TEXT("conout$.txt"), WIDE_TEXT("CONOUT$")},
        // Files whose names only come close.
        {WIDE_TEXT("file1.lv"), WIDE_TEXT("")},
        {WIDE_TEXT("_Aux.lv"), WIDE_TEXT("")},
        {WIDE_TEXT(" AUX.lv"), WIDE_TEXT("")},
        {WIDE_TEXT("Aux 2026-03-07.lv"), WIDE_TEXT("")},
        {WIDE_TEXT("AUXILIARY.lv"), WIDE_TEXT("")},
        {WIDE_TEXT("CONSOLE"), WIDE_TEXT("")},
        {WIDE_TEXT("NULL.lv"), WIDE_TEXT("")},
        {WIDE_TEXT("COM10.lv"), WIDE_TEXT("")},
        {WIDE_TEXT("COM.lv"), WIDE_TEXT("")},
        {WIDE_TEXT("LPTx.lv"), WIDE_TEXT("")},
        {WIDE_TEXT("COM\u2074.lv"), WIDE_TEXT("")},  // superscript four: no port
        {WIDE_TEXT(".lv"), WIDE_TEXT("")},
        {WIDE_TEXT(""), WIDE_TEXT("")},
    };
    for (const auto& test : cases)
        EXPECT_EQ(WideString(test.device), DeviceInFileName(test.name)) << Narrow(test.name);
}

}  // namespace
