// The registration as an installer package writes it: scripts flattened into values, keys that a
// package cannot create, and the WiX include with its escapes.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "server/portable/installer_registry.h"

namespace {

const WideString kPlaceholder = WIDE_TEXT("<module>");

WideString Widen(const std::string& text) {
    return WideString(text.begin(), text.end());
}

std::vector<RegistryKeyOperation> Parse(const std::string& script) {
    std::vector<RegistryKeyOperation> operations;
    RegistryScriptError error;
    EXPECT_TRUE(ParseRegistryScript(Widen(script), {{WIDE_TEXT("MODULE"), kPlaceholder}},
                                    operations, error))
        << error.message;
    return operations;
}

// The include's RegistryValue lines, without the XML around them.
std::vector<std::string> Elements(const std::vector<InstallerRegistryValue>& values) {
    std::string include, error;
    EXPECT_TRUE(WriteWixRegistryInclude(values, kPlaceholder, "[#Dll]", "m", "generated",
                                        include, error))
        << error;
    std::vector<std::string> lines;
    for (size_t start = 0, end; (end = include.find('\n', start)) != std::string::npos;
         start = end + 1) {
        const std::string line = include.substr(start, end - start);
        if (line.find("<RegistryValue") != std::string::npos)
            lines.push_back(line);
    }
    return lines;
}

TEST(InstallerRegistry, ScriptKeysBecomeTheValuesTheyWrite) {
    std::vector<InstallerRegistryValue> values;
    AppendInstallerValues(Parse("HKCR { NoRemove CLSID { ForceRemove {X} = s 'Folder' {\n"
                                "  val InfoTip = s 'Tip'\n"
                                "  InprocServer32 = s '%MODULE%' { val ThreadingModel = s 'Apartment' }\n"
                                "  val Count = d '7' } } }"),
                          values);
    EXPECT_EQ(Elements(values),
              (std::vector<std::string>{
                  R"(  <RegistryValue Id="registry_m_1" Root="HKCR" Key="CLSID\{X}" Type="string" Value="Folder"/>)",
                  R"(  <RegistryValue Id="registry_m_2" Root="HKCR" Key="CLSID\{X}" Name="InfoTip" Type="string" Value="Tip"/>)",
                  R"(  <RegistryValue Id="registry_m_3" Root="HKCR" Key="CLSID\{X}" Name="Count" Type="integer" Value="7"/>)",
                  R"(  <RegistryValue Id="registry_m_4" Root="HKCR" Key="CLSID\{X}\InprocServer32" Type="string" Value="[#Dll]"/>)",
                  R"(  <RegistryValue Id="registry_m_5" Root="HKCR" Key="CLSID\{X}\InprocServer32" Name="ThreadingModel" Type="string" Value="Apartment"/>)"}));
}

TEST(InstallerRegistry, TextIsEscapedForXmlAndForTheInstallersFormattedStrings) {
    const struct {
        std::string text;
        std::string written;
    } cases[] = {
        {"[Property] & <tag>", R"([\[]Property[\]] &amp; &lt;tag&gt;)"},
        {"#1 first", "##1 first"},  // a leading '#' would make the value a number
        {"not #first", "not #first"},
        {"say \"hi\"", "say &quot;hi&quot;"},
    };
    for (const auto& c : cases) {
        const std::vector<std::string> lines =
            Elements({{.key = WIDE_TEXT("Key"), .text = Widen(c.text)}});
        ASSERT_EQ(1u, lines.size());
        EXPECT_NE(std::string::npos, lines[0].find("Value=\"" + c.written + "\"")) << lines[0];
    }
    const InstallerRegistryValue german{.key = WIDE_TEXT("Key"),
                                        .text = WIDE_TEXT("Gr\u00FC\u00DFe")};
    EXPECT_NE(std::string::npos, Elements({german})[0].find("Value=\"Gr\xC3\xBC\xC3\x9F" "e\""));
}

TEST(InstallerRegistry, BinaryValuesAreMarkedForThePackagerAndWrittenInHex) {
    InstallerRegistryValue attributes;
    attributes.key = WIDE_TEXT("CLSID\\{X}\\ShellFolder");
    attributes.name = WIDE_TEXT("Attributes");
    attributes.type = InstallerValueType::Binary;
    attributes.bytes = {0x00, 0x00, 0x00, 0xA0};
    EXPECT_EQ(
        Elements({attributes})[0],
        R"(  <RegistryValue Id="binary_m_1" Root="HKCR" Key="CLSID\{X}\ShellFolder" Name="Attributes" Type="binary" Value="000000A0"/>)");
}

TEST(InstallerRegistry, WhatAPackageCannotWriteIsRefused) {
    std::string include, error;
    // A root the package has no name for, and an empty text (which a package cannot write).
    const InstallerRegistryValue config{
        .root = RegistryRoot::CurrentConfig, .key = WIDE_TEXT("Key"), .text = WIDE_TEXT("x")};
    EXPECT_FALSE(WriteWixRegistryInclude({config}, kPlaceholder, "", "m", "", include, error));
    EXPECT_FALSE(WriteWixRegistryInclude({{.key = WIDE_TEXT("Key")}}, kPlaceholder, "", "m", "",
                                         include, error));
}

TEST(InstallerRegistry, OnlyKeysThatUnregistrationDeletesMustHoldAValue) {
    const auto operations = Parse(
        "HKCR { NoRemove CLSID { ForceRemove {X} = s 'Folder' { ShellFolder Parent { Child = s 'c' } } } }");
    std::vector<InstallerRegistryValue> values;
    AppendInstallerValues(operations, values);
    // ShellFolder holds nothing; Parent holds its child's value; CLSID is NoRemove.
    EXPECT_EQ(WIDE_TEXT("CLSID\\{X}\\ShellFolder"), FindKeyLeftEmpty(operations, values));

    InstallerRegistryValue attributes;
    attributes.key = WIDE_TEXT("clsid\\{x}\\shellfolder");  // keys compare without case
    attributes.name = WIDE_TEXT("Attributes");
    attributes.type = InstallerValueType::Binary;
    values.push_back(attributes);
    EXPECT_EQ(WideString(), FindKeyLeftEmpty(operations, values));
}

}  // namespace
