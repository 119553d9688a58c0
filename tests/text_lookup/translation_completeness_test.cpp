// The shipped German file against the string table: every English text that a user can see has
// a German entry, so that a new string without a translation fails here and not in front of a
// German user.
#include <windows.h>

#include <gtest/gtest.h>

#include <set>
#include <string>
#include <vector>

#include "stations/portable/station_fields.h"
#include "support/module_instance.h"
#include "support/text_lookup.h"

namespace {

// Texts of the string table that no user sees: none so far. A text goes here only with the
// reason it is never shown.
const std::set<std::wstring> kNeverShown = {};

BOOL CALLBACK CollectBlock(HMODULE, LPCWSTR, LPWSTR name, LONG_PTR blocks) {
    reinterpret_cast<std::vector<UINT>*>(blocks)->push_back(
        static_cast<UINT>(reinterpret_cast<ULONG_PTR>(name)));
    return TRUE;
}

// Every id of the module's string table (blocks of 16 ids, each block one resource).
std::vector<UINT> StringIds(HMODULE module) {
    std::vector<UINT> blocks;
    // An empty table reads as no ids, which the test reports.
    (void)::EnumResourceNamesW(module, RT_STRING, CollectBlock, reinterpret_cast<LONG_PTR>(&blocks));
    std::vector<UINT> ids;
    for (UINT block : blocks) {
        for (UINT index = 0; index < 16; ++index) {
            const UINT id = (block - 1) * 16 + index;
            if (!LoadEnglishString(module, id).empty())
                ids.push_back(id);
        }
    }
    return ids;
}

TranslationMap GermanFile() {
    const std::wstring file =
        FindTranslationFile(ModuleFilePath(ThisModule()), MAKELANGID(LANG_GERMAN, SUBLANG_GERMAN));
    EXPECT_FALSE(file.empty()) << "no de-DE\\ShellExt.txt beside the test";
    TranslationMap german;
    EXPECT_EQ(S_OK, LoadTranslationFile(file, german));
    return german;
}

TEST(GermanTranslation, CoversEveryTextOfTheStringTable) {
    const HMODULE module = ThisModule();
    const TranslationMap german = GermanFile();

    const std::vector<UINT> ids = StringIds(module);
    ASSERT_GT(ids.size(), 50u) << "the string table was not read";
    for (UINT id : ids) {
        const std::wstring english = LoadEnglishString(module, id);
        if (kNeverShown.count(english))
            continue;
        const auto found = german.find(english);
        EXPECT_TRUE(found != german.end() && !found->second.empty())
            << "string " << id << " has no German entry: \""
            << std::string(english.begin(), english.end()) << "\"";
    }
}

// The reasons the station sheet gives for a refused value are translated by their English format,
// with the same number of values in the German one.
TEST(GermanTranslation, CoversEveryReasonForARefusedStationValue) {
    const TranslationMap german = GermanFile();
    const auto places = [](const std::wstring& text) {
        size_t count = 0;
        for (size_t at = text.find(L"%s"); at != std::wstring::npos; at = text.find(L"%s", at + 2))
            ++count;
        return count;
    };
    for (const WideStringView format : RefusalFormats()) {
        const std::wstring english(format);
        const auto found = german.find(english);
        ASSERT_TRUE(found != german.end() && !found->second.empty())
            << "no German entry: \"" << std::string(english.begin(), english.end()) << "\"";
        EXPECT_EQ(places(english), places(found->second))
            << std::string(english.begin(), english.end());
    }
}

}  // namespace
