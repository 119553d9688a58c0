// Translation-file parser: encodings, pairing, blank lines, comments, escapes, broken input.
#include "support/portable/translation_file.h"

#include <gtest/gtest.h>

#include <vector>

namespace {

std::vector<uint8_t> Utf16File(WideStringView text, bool mark = true) {
    std::vector<uint8_t> bytes;
    if (mark)
        bytes = {0xFF, 0xFE};
    for (WideChar character : text) {
        bytes.push_back(static_cast<uint8_t>(character & 0xFF));
        bytes.push_back(static_cast<uint8_t>(character >> 8));
    }
    return bytes;
}

std::vector<uint8_t> Utf8File(std::string_view text) {
    return {text.begin(), text.end()};
}

TranslationMap Parse(const std::vector<uint8_t>& bytes) {
    TranslationMap map;
    EXPECT_TRUE(ParseTranslationFile(bytes.data(), bytes.size(), map));
    return map;
}

}  // namespace

TEST(TranslationFile, PairsEachBracketedTextWithTheNextOne) {
    const struct {
        const char* rule;
        WideString file;
        TranslationMap expected;
    } cases[] = {
        {"CR LF, LF and CR end lines; a translation may equal its text",
         WIDE_TEXT("[Cancel]\r\n[Abbrechen]\r\n\r\n[Start]\n[Starten]\n\r[Status:]\r[Status:]"),
         {{WIDE_TEXT("Cancel"), WIDE_TEXT("Abbrechen")},
          {WIDE_TEXT("Start"), WIDE_TEXT("Starten")},
          {WIDE_TEXT("Status:"), WIDE_TEXT("Status:")}}},
        {"a text runs to the last bracket of its line and keeps its note; what follows is ignored",
         WIDE_TEXT(
             "[Push [SET] key]   ; the key's name stays\r\n[[SET]-Taste drücken] ; translated\r\n"
             "[Start@@button, at most 10 letters]\r\n[Starten]\r\n"),
         {{WIDE_TEXT("Push [SET] key"), WIDE_TEXT("[SET]-Taste drücken")},
          {WIDE_TEXT("Start@@button, at most 10 letters"), WIDE_TEXT("Starten")}}},
        {"comments inside a pair are skipped, but a blank line drops a lone English text",
         WIDE_TEXT("; German texts\r\n[Cancel]\r\n# button\r\n[Abbrechen]\r\n"
                   "[Forgotten English line]\r\n   \t\r\n[Start]\r\n[Starten]\r\n"),
         {{WIDE_TEXT("Cancel"), WIDE_TEXT("Abbrechen")},
          {WIDE_TEXT("Start"), WIDE_TEXT("Starten")}}},
        {"a line without its closing bracket is no text: the next lines pair up",
         WIDE_TEXT("[Cancel\r\n[Abbrechen]\r\n[Start]\r\n[Starten]\r\n"),
         {{WIDE_TEXT("Abbrechen"), WIDE_TEXT("Start")}}},
        {"the first pair of a text wins; an empty translation is kept, an empty text is not",
         WIDE_TEXT("[Start]\r\n[Starten]\r\n[Start]\r\n[Beginnen]\r\n[Name]\r\n[]\r\n[]\r\n[x]"),
         {{WIDE_TEXT("Start"), WIDE_TEXT("Starten")}, {WIDE_TEXT("Name"), WIDE_TEXT("")}}},
        {"escapes are decoded in both texts",
         WIDE_TEXT("[a\\nb\\tc\\rd\\\\e]\r\n[A\\nB\\\\C]\r\n"),
         {{WIDE_TEXT("a\nb\tc\rd\\e"), WIDE_TEXT("A\nB\\C")}}},
    };
    for (const auto& test : cases)
        EXPECT_EQ(test.expected, Parse(Utf16File(test.file))) << test.rule;
}

TEST(TranslationFile, EscapesAreDecodedOneKindAfterTheOther) {
    EXPECT_EQ(DecodeTranslationEscapes(WIDE_TEXT("C:\\\\new")), WIDE_TEXT("C:\\\new"));
    EXPECT_EQ(DecodeTranslationEscapes(WIDE_TEXT("50\\\\%")), WIDE_TEXT("50\\%"));
    EXPECT_EQ(DecodeTranslationEscapes(WIDE_TEXT("\\x\\")), WIDE_TEXT("\\x\\"));
}

TEST(TranslationFile, ReadsUtf8AndUnmarkedUtf16) {
    TranslationMap map = Parse(Utf8File("\xEF\xBB\xBF[Cancel]\r\n[Abbrechen \xE2\x9C\x93]\r\n"));
    EXPECT_EQ(map.at(WIDE_TEXT("Cancel")), WIDE_TEXT("Abbrechen \u2713"));
    map = Parse(Utf8File("[Start]\n[St\xC3\xA4rt \xF0\x9F\x98\x80]\n"));
    EXPECT_EQ(map.at(WIDE_TEXT("Start")), WIDE_TEXT("Stärt \U0001F600"));
    map = Parse(Utf16File(WIDE_TEXT("[Name]\r\n[Bezeichnung]\r\n"), false));
    EXPECT_EQ(map.at(WIDE_TEXT("Name")), WIDE_TEXT("Bezeichnung"));
}

TEST(TranslationFile, BrokenUtf8BecomesReplacementCharacters) {
    const TranslationMap map = Parse(Utf8File("[a]\n[\xC3(\xE2\x82\xC0\x80\xED\xA0\x80\xF4]"));
    // Each bad sequence is one replacement: a cut pair, a cut triple, an overlong zero, an encoded
    // surrogate and a lead byte without its continuation.
    EXPECT_EQ(map.at(WIDE_TEXT("a")), WIDE_TEXT("\uFFFD(\uFFFD\uFFFD\uFFFD\uFFFD"));
}

TEST(TranslationFile, RejectsTooShortAndBigEndianFiles) {
    TranslationMap map{{WIDE_TEXT("kept"), WIDE_TEXT("bleibt")}};
    const uint8_t one[] = {'['};
    EXPECT_FALSE(ParseTranslationFile(one, 1, map));
    EXPECT_FALSE(ParseTranslationFile(nullptr, 0, map));
    const uint8_t bigEndian[] = {0xFE, 0xFF, 0, '[', 0, 'a', 0, ']'};
    EXPECT_FALSE(ParseTranslationFile(bigEndian, sizeof bigEndian, map));
    EXPECT_EQ(map.size(), 1u);
}

TEST(TranslationFile, TruncatedFilesKeepWhatIsComplete) {
    std::vector<uint8_t> bytes = Utf16File(WIDE_TEXT("[Start]\r\n[Starten]\r\n[Cancel]\r\n[Abb]"));
    // Cut in the middle of the last character: the odd byte is dropped, the line loses its "]".
    bytes.pop_back();
    const TranslationMap map = Parse(bytes);
    EXPECT_EQ(map.size(), 1u);
    EXPECT_EQ(map.at(WIDE_TEXT("Start")), WIDE_TEXT("Starten"));
}
