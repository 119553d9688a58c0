// The registry-script parser: the operations a script yields, placeholders, and rejected scripts.
#include <gtest/gtest.h>

#include <string>

#include "server/portable/registry_script.h"

namespace {

const std::vector<RegistryScriptReplacement> kModule = {
    {WIDE_TEXT("MODULE"), WIDE_TEXT("C:\\Program Files\\Quorvel\\LVShellExt.dll")}};

WideString Widen(const std::string& text) {
    return WideString(text.begin(), text.end());
}

std::vector<RegistryKeyOperation> ParseOrFail(const std::string& script) {
    std::vector<RegistryKeyOperation> operations;
    RegistryScriptError error;
    EXPECT_TRUE(ParseRegistryScript(Widen(script), kModule, operations, error))
        << "line " << error.line << ": " << error.message;
    return operations;
}

const char kClassScript[] = R"(HKCR
{
	LVShellExt.LVExtractIcon.1 = s 'LVExtractIcon Class'
	{
		CLSID = s '{9E2B6D14-7C3A-4F85-B1D9-36A8E05C7F21}'
	}
	NoRemove CLSID
	{
		ForceRemove {9E2B6D14-7C3A-4F85-B1D9-36A8E05C7F21} = s 'LVExtractIcon Class'
		{
			InprocServer32 = s '%MODULE%'
			{
				val ThreadingModel = s 'Apartment'
			}
		}
	}
}
HKLM
{
	NoRemove Software
	{
		val Count = d '0x0000A0'
		val Plain = d 42
	}
}
)";

}  // namespace

TEST(RegistryScript, YieldsEveryKeyParentFirstWithFullPathsFlagsAndValues) {
    const auto operations = ParseOrFail(kClassScript);
    ASSERT_EQ(6u, operations.size());

    EXPECT_EQ(WIDE_TEXT("LVShellExt.LVExtractIcon.1"), operations[0].path);
    EXPECT_EQ(RegistryRoot::ClassesRoot, operations[0].root);
    EXPECT_EQ(1u, operations[0].depth);
    ASSERT_TRUE(operations[0].defaultValue.has_value());
    EXPECT_EQ(WIDE_TEXT("LVExtractIcon Class"), operations[0].defaultValue->text);

    EXPECT_EQ(WIDE_TEXT("LVShellExt.LVExtractIcon.1\\CLSID"), operations[1].path);
    EXPECT_TRUE(operations[2].noRemove);
    EXPECT_FALSE(operations[2].defaultValue.has_value());

    const RegistryKeyOperation& classKey = operations[3];
    EXPECT_EQ(WIDE_TEXT("CLSID\\{9E2B6D14-7C3A-4F85-B1D9-36A8E05C7F21}"), classKey.path);
    EXPECT_TRUE(classKey.forceRemove);
    EXPECT_FALSE(classKey.noRemove);

    const RegistryKeyOperation& server = operations[4];
    EXPECT_EQ(3u, server.depth);
    ASSERT_TRUE(server.defaultValue.has_value());
    EXPECT_EQ(kModule[0].value, server.defaultValue->text);
    ASSERT_EQ(1u, server.values.size());
    EXPECT_EQ((RegistryScriptValue{WIDE_TEXT("ThreadingModel"), RegistryValueType::String,
                                   WIDE_TEXT("Apartment"), 0}),
              server.values[0]);

    const RegistryKeyOperation& software = operations[5];
    EXPECT_EQ(RegistryRoot::LocalMachine, software.root);
    ASSERT_EQ(2u, software.values.size());
    EXPECT_EQ(RegistryValueType::Dword, software.values[0].type);
    EXPECT_EQ(0xA0u, software.values[0].number);
    EXPECT_EQ(42u, software.values[1].number);
}

TEST(RegistryScript, KeywordsIgnoreCaseButNamesKeepItAndQuotedKeywordsAreNames) {
    const auto operations = ParseOrFail(
        "hkey_current_user { noremove 'val' { VAL 'NoRemove' = S 'x' } 'ForceRemove' }");
    ASSERT_EQ(2u, operations.size());
    EXPECT_EQ(RegistryRoot::CurrentUser, operations[0].root);
    EXPECT_EQ(WIDE_TEXT("val"), operations[0].path);
    EXPECT_TRUE(operations[0].noRemove);
    ASSERT_EQ(1u, operations[0].values.size());
    EXPECT_EQ(WIDE_TEXT("NoRemove"), operations[0].values[0].name);
    EXPECT_EQ(WIDE_TEXT("ForceRemove"), operations[1].path);
    EXPECT_FALSE(operations[1].forceRemove);
}

TEST(RegistryScript, ReplacementTextsCannotChangeTheStructure) {
    // A module path holding a quote, braces and a percent sign stays one value text.
    const std::vector<RegistryScriptReplacement> hostile = {
        {WIDE_TEXT("MODULE"), WIDE_TEXT("C:\\it's } { %MODULE% 100%.dll")}};
    std::vector<RegistryKeyOperation> operations;
    RegistryScriptError error;
    ASSERT_TRUE(
        ParseRegistryScript(Widen("HKCR { Icon = s '%MODULE%,0' { val Pct = s '100%% done' } }"),
                            hostile, operations, error));
    ASSERT_EQ(1u, operations.size());
    EXPECT_EQ(WIDE_TEXT("C:\\it's } { %MODULE% 100%.dll,0"), operations[0].defaultValue->text);
    EXPECT_EQ(WIDE_TEXT("100% done"), operations[0].values[0].text);
}

TEST(RegistryScript, DoubledQuotesStandForOneQuotedTextMaySpanLinesAndEmptyScriptsAreEmpty) {
    const auto operations = ParseOrFail("HKCR\n{\n  K = s 'it''s\nhere'\n}\n");
    ASSERT_EQ(1u, operations.size());
    EXPECT_EQ(WIDE_TEXT("it's\nhere"), operations[0].defaultValue->text);
    EXPECT_TRUE(ParseOrFail(" \r\n\t ").empty());
    EXPECT_TRUE(ParseOrFail("HKLM { }").empty());
}

struct MalformedScript {
    const char* script;
    size_t line;
};

class RegistryScriptRejects : public testing::TestWithParam<MalformedScript> {};

TEST_P(RegistryScriptRejects, WithAnErrorAndNoOperations) {
    std::vector<RegistryKeyOperation> operations{RegistryKeyOperation{}};
    RegistryScriptError error;
    EXPECT_FALSE(ParseRegistryScript(Widen(GetParam().script), kModule, operations, error));
    EXPECT_TRUE(operations.empty()) << "a rejected script yields nothing to write";
    EXPECT_FALSE(error.message.empty());
    EXPECT_EQ(GetParam().line, error.line) << error.message;
}

INSTANTIATE_TEST_SUITE_P(
    Malformed, RegistryScriptRejects,
    testing::Values(MalformedScript{"HKCR { A = s 'x' { B }", 1},           // block left open
                    MalformedScript{"HKCR { A }\nHKXX { B }", 2},           // unknown root
                    MalformedScript{"HKCR A", 1},                           // root without block
                    MalformedScript{"}", 1},                                // stray brace
                    MalformedScript{"HKCR {\n val X = s 'y' }", 2},         // value on a root
                    MalformedScript{"HKCR { NoRemove ForceRemove A }", 1},  // both modifiers
                    MalformedScript{"HKCR { NoRemove NoRemove A }", 1},     // modifier twice
                    MalformedScript{"HKCR { A = s 'open }", 1},             // quote left open
                    MalformedScript{"HKCR { A = s '%OTHER%' }", 1},         // unknown placeholder
                    MalformedScript{"HKCR { A = s '50% }' }", 1},           // lone percent
                    MalformedScript{"HKCR { A = d '12x' }", 1},             // not a number
                    MalformedScript{"HKCR { A = d '4294967296' }", 1},      // over 32 bits
                    MalformedScript{"HKCR { A = d '0x' }", 1},              // no hex digits
                    MalformedScript{"HKCR { A = b '00' }", 1},              // unknown type
                    MalformedScript{"HKCR { A = }", 1},                     // no data
                    MalformedScript{"HKCR { A = s }", 1},                   // brace as data
                    MalformedScript{"HKCR { '' }", 1},                      // empty name
                    MalformedScript{"HKCR { 'A\\B' }", 1},                  // separator in name
                    MalformedScript{"HKCR { A { val = s 'x' } }", 1},       // val without name
                    MalformedScript{"HKCR { A { val X s 'x' } }", 1}));     // val without '='

TEST(RegistryScript, RejectsOverlongNamesAndDeepNesting) {
    std::vector<RegistryKeyOperation> operations;
    RegistryScriptError error;
    const std::string longName(kMaxRegistryKeyNameLength + 1, 'k');
    EXPECT_FALSE(
        ParseRegistryScript(Widen("HKCR { " + longName + " }"), kModule, operations, error));
    EXPECT_TRUE(ParseOrFail("HKCR { " + longName.substr(1) + " }").size() == 1);

    std::string deep = "HKCR";
    for (size_t level = 0; level < kMaxRegistryScriptDepth + 1; ++level)
        deep += " { K";
    for (size_t level = 0; level < kMaxRegistryScriptDepth + 1; ++level)
        deep += " }";
    deep += " }";
    EXPECT_FALSE(ParseRegistryScript(Widen(deep), kModule, operations, error));
    EXPECT_NE(std::string::npos, error.message.find("deep"));
}

TEST(RegistryScriptBytes, DecodesAsciiAndUtf16WithByteOrderMarkAndDropsZeroPadding) {
    WideString text;
    const uint8_t ascii[] = {'H', 'K', 'C', 'R', 0, 0};
    ASSERT_TRUE(DecodeRegistryScriptBytes(ascii, sizeof ascii, text));
    EXPECT_EQ(WIDE_TEXT("HKCR"), text);

    const uint8_t utf16[] = {0xFF, 0xFE, 'H', 0, 0xE9, 0, 0, 0};
    ASSERT_TRUE(DecodeRegistryScriptBytes(utf16, sizeof utf16, text));
    EXPECT_EQ(WideString({WideChar('H'), WideChar(0xE9)}), text);
}

TEST(RegistryScriptBytes, RejectsHighBytesInnerZerosAndOddUtf16) {
    WideString text;
    const uint8_t high[] = {'H', 0xC3, 0xA9};
    EXPECT_FALSE(DecodeRegistryScriptBytes(high, sizeof high, text));
    const uint8_t innerZero[] = {'H', 0, 'K'};
    EXPECT_FALSE(DecodeRegistryScriptBytes(innerZero, sizeof innerZero, text));
    EXPECT_TRUE(text.empty());
    const uint8_t odd[] = {0xFF, 0xFE, 'H'};
    EXPECT_FALSE(DecodeRegistryScriptBytes(odd, sizeof odd, text));
    const uint8_t utf16InnerZero[] = {0xFF, 0xFE, 'H', 0, 0, 0, 'K', 0};
    EXPECT_FALSE(DecodeRegistryScriptBytes(utf16InnerZero, sizeof utf16InnerZero, text));
}
