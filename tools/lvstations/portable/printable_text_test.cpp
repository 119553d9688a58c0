// The escapes lvstations prints instead of what a terminal would act on.
#include <gtest/gtest.h>

#include "tools/lvstations/portable/printable_text.h"

TEST(PrintableText, EscapesWhatATerminalActsOnAndKeepsTheRest) {
    const struct {
        WideString text;
        WideString printed;
    } cases[] = {
        {WIDE_TEXT("North level 3 (Ost) äöü €"), WIDE_TEXT("North level 3 (Ost) äöü €")},
        {WIDE_TEXT("Forged\r\nSecond line"), WIDE_TEXT("Forged\\x0D\\x0ASecond line")},
        {WIDE_TEXT("\x1B[31mred\x1B[0m"), WIDE_TEXT("\\x1B[31mred\\x1B[0m")},
        {WIDE_TEXT("tab\tbell\a"), WIDE_TEXT("tab\\x09bell\\x07")},
        {WideString{WIDE_TEXT('a'), 0, WIDE_TEXT('b')}, WIDE_TEXT("a\\x00b")},
        {WIDE_TEXT("del\x7F csi\x9B nel\x85"), WIDE_TEXT("del\\x7F csi\\x9B nel\\x85")},
        {WIDE_TEXT("\xA0no-break stays"), WIDE_TEXT("\xA0no-break stays")},
        {WIDE_TEXT("a\\x1B"), WIDE_TEXT("a\\\\x1B")},  // an escape in the name is not one printed
        {WIDE_TEXT("line\x2028para\x2029"), WIDE_TEXT("line\\u2028para\\u2029")},
        {WIDE_TEXT("abc\x202E"
                   "fdp.exe"),
         WIDE_TEXT("abc\\u202Efdp.exe")},
        {WIDE_TEXT("\x2066isolate\x2069 \x200Emark"),
         WIDE_TEXT("\\u2066isolate\\u2069 \\u200Emark")},
        {WIDE_TEXT("pair \xD83D\xDE00 kept"), WIDE_TEXT("pair \xD83D\xDE00 kept")},
        {WideString{0xD83D, WIDE_TEXT('x')}, WIDE_TEXT("\\uD83Dx")},  // high without low
        {WideString{WIDE_TEXT('x'), 0xDE00}, WIDE_TEXT("x\\uDE00")},  // low alone
        {WideString{0xD83D}, WIDE_TEXT("\\uD83D")},                   // high at the end
        {WIDE_TEXT(""), WIDE_TEXT("")},
    };
    for (const auto& test : cases) {
        const WideString printed = PrintableText(test.text);
        EXPECT_EQ(test.printed, printed);
        for (WideChar unit : printed) {
            const auto code = static_cast<uint16_t>(unit);
            EXPECT_FALSE(code < 0x20 || (code >= 0x7F && code <= 0x9F)) << "control " << code;
        }
    }
}
