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

std::string Narrow(const WideString& text) {
    return std::string(text.begin(), text.end());
}

// One operation as one line: root, depth, path, modifiers, default value and named values.
std::string Describe(const RegistryKeyOperation& key) {
    static const char* const kRoots[] = {"HKCR", "HKCU", "HKLM", "HKU", "HKCC"};
    std::string text = kRoots[static_cast<int>(key.root)] + (" " + std::to_string(key.depth)) +
                       " " + Narrow(key.path) + (key.noRemove ? " NoRemove" : "") +
                       (key.forceRemove ? " ForceRemove" : "");
    if (key.defaultValue)
        text += " = '" + Narrow(key.defaultValue->text) + "'";
    for (const RegistryScriptValue& value : key.values) {
        text += " val " + Narrow(value.name) +
                (value.type == RegistryValueType::Dword ? " = d " + std::to_string(value.number)
                                                        : " = s '" + Narrow(value.text) + "'");
    }
    return text;
}

std::vector<std::string> ParseOrFail(const std::string& script,
                                     const std::vector<RegistryScriptReplacement>& replacements) {
    std::vector<RegistryKeyOperation> operations;
    RegistryScriptError error;
    EXPECT_TRUE(ParseRegistryScript(Widen(script), replacements, operations, error))
        << "line " << error.line << ": " << error.message;
    std::vector<std::string> described;
    for (const RegistryKeyOperation& key : operations)
        described.push_back(Describe(key));
    return described;
}

}  // namespace

TEST(RegistryScript, YieldsEveryKeyParentFirstWithFullPathsFlagsAndValues) {
    const char script[] = R"(HKCR
{
	NoRemove CLSID
	{
		ForceRemove {9E2B6D14-7C3A-4F85-B1D9-36A8E05C7F21} = s 'LVExtractIcon Class'
		{
			InprocServer32 = s '%MODULE%' { val ThreadingModel = s 'Apartment' }
		}
	}
}
HKLM { Software { val Count = d '0x0000A0'  val Plain = d 42 } })";
    const std::vector<std::string> expected = {
        "HKCR 1 CLSID NoRemove",
        "HKCR 2 CLSID\\{9E2B6D14-7C3A-4F85-B1D9-36A8E05C7F21} ForceRemove = 'LVExtractIcon Class'",
        "HKCR 3 CLSID\\{9E2B6D14-7C3A-4F85-B1D9-36A8E05C7F21}\\InprocServer32"
        " = 'C:\\Program Files\\Quorvel\\LVShellExt.dll' val ThreadingModel = s 'Apartment'",
        "HKLM 1 Software val Count = d 160 val Plain = d 42",
    };
    EXPECT_EQ(expected, ParseOrFail(script, kModule));
}

TEST(RegistryScript, NamesQuotesAndReplacementTextsAreReadAsTheyStand) {
    const std::string longest(kMaxRegistryKeyNameLength, 'k');
    // A module path holding a quote, braces and a percent sign stays one value text.
    const std::vector<RegistryScriptReplacement> hostile = {
        {WIDE_TEXT("MODULE"), WIDE_TEXT("C:\\it's } { %MODULE% 100%.dll")}};
    const struct {
        const char* rule;
        std::string script;
        std::vector<std::string> expected;
        std::vector<RegistryScriptReplacement> replacements = kModule;
    } cases[] = {
        {"keywords ignore case, names keep it, and quoted keywords are names",
         "hkey_current_user { noremove 'val' { VAL 'NoRemove' = S 'x' } 'ForceRemove' }",
         {"HKCU 1 val NoRemove val NoRemove = s 'x'", "HKCU 1 ForceRemove"}},
        {"a doubled quote stands for one, and a quoted text may span lines",
         "HKCR\n{\n  K = s 'it''s\nhere'\n}\n",
         {"HKCR 1 K = 'it's\nhere'"}},
        {"an empty script", " \r\n\t ", {}},
        {"a root without keys", "HKLM { }", {}},
        {"a name of the longest length", "HKCR { " + longest + " }", {"HKCR 1 " + longest}},
        {"replacement texts cannot change the structure",
         "HKCR { Icon = s '%MODULE%,0' { val Pct = s '100%% done' } }",
         {"HKCR 1 Icon = 'C:\\it's } { %MODULE% 100%.dll,0' val Pct = s '100% done'"},
         hostile},
    };
    for (const auto& test : cases)
        EXPECT_EQ(test.expected, ParseOrFail(test.script, test.replacements)) << test.rule;
}

TEST(RegistryScript, MalformedScriptsAreRejectedAtTheirLineWithNoOperations) {
    std::string deep = "HKCR";  // one level deeper than allowed, the braces balanced
    for (size_t level = 0; level <= kMaxRegistryScriptDepth; ++level)
        deep += " { K";
    for (size_t level = 0; level <= kMaxRegistryScriptDepth; ++level)
        deep += " }";
    const struct {
        std::string script;
        size_t line;
    } cases[] = {
        {"HKCR { A = s 'x' { B }", 1},           // block left open
        {"HKCR { A }\nHKXX { B }", 2},           // unknown root
        {"HKCR A", 1},                           // root without block
        {"}", 1},                                // stray brace
        {"HKCR {\n val X = s 'y' }", 2},         // value on a root
        {"HKCR { NoRemove ForceRemove A }", 1},  // both modifiers
        {"HKCR { NoRemove NoRemove A }", 1},     // modifier twice
        {"HKCR { A = s 'open }", 1},             // quote left open
        {"HKCR { A = s '%OTHER%' }", 1},         // unknown placeholder
        {"HKCR { A = s '50% }' }", 1},           // lone percent
        {"HKCR { A = d '12x' }", 1},             // not a number
        {"HKCR { A = d '4294967296' }", 1},      // over 32 bits
        {"HKCR { A = d '0x' }", 1},              // no hex digits
        {"HKCR { A = b '00' }", 1},              // unknown type
        {"HKCR { A = }", 1},                     // no data
        {"HKCR { A = s }", 1},                   // brace as data
        {"HKCR { '' }", 1},                      // empty name
        {"HKCR { 'A\\B' }", 1},                  // separator in name
        {"HKCR { A { val = s 'x' } }", 1},       // val without name
        {"HKCR { A { val X s 'x' } }", 1},       // val without '='
        {"HKCR { " + std::string(kMaxRegistryKeyNameLength + 1, 'k') + " }", 1},  // name too long
        {deep, 1},                                                                // nested too deep
    };
    for (const auto& test : cases) {
        std::vector<RegistryKeyOperation> operations{RegistryKeyOperation{}};
        RegistryScriptError error;
        EXPECT_FALSE(ParseRegistryScript(Widen(test.script), kModule, operations, error))
            << test.script;
        EXPECT_TRUE(operations.empty()) << "a rejected script yields nothing to write";
        EXPECT_FALSE(error.message.empty()) << test.script;
        EXPECT_EQ(test.line, error.line) << test.script << ": " << error.message;
    }
}

TEST(RegistryScriptBytes, DecodesAsciiAndUtf16ButNotHighBytesInnerZerosOrOddUtf16) {
    const struct {
        std::vector<uint8_t> bytes;
        bool decodes;
        WideString text;
    } cases[] = {
        {{'H', 'K', 'C', 'R', 0, 0}, true, WIDE_TEXT("HKCR")},  // zero padding is dropped
        {{0xFF, 0xFE, 'H', 0, 0xE9, 0, 0, 0}, true, WIDE_TEXT("H\u00E9")},
        {{'H', 0xC3, 0xA9}, false, {}},
        {{'H', 0, 'K'}, false, {}},
        {{0xFF, 0xFE, 'H'}, false, {}},
        {{0xFF, 0xFE, 'H', 0, 0, 0, 'K', 0}, false, {}},
    };
    for (const auto& test : cases) {
        WideString text = WIDE_TEXT("stale");
        EXPECT_EQ(test.decodes,
                  DecodeRegistryScriptBytes(test.bytes.data(), test.bytes.size(), text))
            << test.bytes.size();
        EXPECT_EQ(test.text, text) << test.bytes.size();
    }
}
