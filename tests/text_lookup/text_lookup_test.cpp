// Text lookup: string table, note cut, the translation-file search order, the cache, the shipped
// German file, and broken files falling back to English.
#include "support/text_lookup.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <string>
#include <thread>

#include "res/resource.h"
#include "support/module_instance.h"

namespace {

constexpr LANGID kGerman = MAKELANGID(LANG_GERMAN, SUBLANG_GERMAN);
namespace fs = std::filesystem;

void WriteBytes(const fs::path& path, const std::string& bytes) {
    fs::create_directories(path.parent_path());
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
}

// A UTF-16LE translation file with its byte-order mark.
void WriteTranslations(const fs::path& path, const std::wstring& text) {
    WriteBytes(path, "\xFF\xFE" + std::string(reinterpret_cast<const char*>(text.data()),
                                              text.size() * sizeof(wchar_t)));
}

// A scratch directory that plays the directory of a module named LVShellExt.dll.
class TranslationFolder : public ::testing::Test {
protected:
    void SetUp() override {
        wchar_t temp[MAX_PATH] = {};
        ASSERT_NE(::GetTempPathW(MAX_PATH, temp), 0u);
        directory_ =
            fs::path(temp) / (L"lv_text_lookup_" + std::to_wstring(::GetCurrentProcessId()));
        fs::remove_all(directory_);
        fs::create_directories(directory_);
        modulePath_ = (directory_ / L"LVShellExt.dll").wstring();
        ClearTranslationCache();
    }
    void TearDown() override {
        ClearTranslationCache();
        std::error_code ignored;
        fs::remove_all(directory_, ignored);
    }
    std::wstring German(const std::wstring& english) {
        return TranslateTextForModulePath(english, kEnglishLanguage, kGerman, modulePath_);
    }

    fs::path directory_;
    std::wstring modulePath_;
};

}  // namespace

TEST(StringTable, MissingIdsGiveEmptyTextsInEveryLanguage) {
    // The texts of present ids are checked wherever they are shown.
    EXPECT_EQ(LoadEnglishString(ThisModule(), 4095), L"");
    EXPECT_EQ(LoadText(ThisModule(), 4095, kGerman), L"");
}

TEST_F(TranslationFolder, TranslationIsLookedUpWithTheNoteWhichIsCutOnlyInEnglish) {
    WriteTranslations(directory_ / L"ShellExt.txt",
                      L"[Start@@the button]\r\n[Los@@geht's]\r\n[Empty]\r\n[]\r\n");
    EXPECT_EQ(TranslateTextForModulePath(L"Start@@the button", kEnglishLanguage, kEnglishLanguage,
                                         modulePath_),
              L"Start");
    EXPECT_EQ(German(L"Start@@the button"), L"Los@@geht's");  // shown as it stands
    EXPECT_EQ(German(L"Start@@another note"), L"Start");      // not in the file: note cut
    EXPECT_EQ(German(L"@@only a note"), L"");
    EXPECT_EQ(German(L"Empty@@x"), L"Empty");  // the key differs by its note: not found
    EXPECT_EQ(German(L"Empty"), L"Empty");     // an empty translation shows the English
}

TEST_F(TranslationFolder, SearchOrderPrefersLocaleFolderAndModuleName) {
    const fs::path shared = directory_ / L"ShellExt.txt";
    const fs::path localeShared = directory_ / L"de-DE" / L"ShellExt.txt";
    const fs::path moduleNamed = directory_ / L"LVShellExt.txt";
    const fs::path localeModuleNamed = directory_ / L"de-DE" / L"LVShellExt.txt";

    EXPECT_EQ(FindTranslationFile(modulePath_, kGerman), L"");
    WriteTranslations(shared, L"[Cancel]\r\n[shared]\r\n");
    EXPECT_EQ(German(L"Cancel"), L"shared");

    const std::pair<fs::path, const wchar_t*> betterOnes[] = {
        {localeShared, L"locale shared"},
        {moduleNamed, L"module named"},
        {localeModuleNamed, L"locale module named"}};
    for (const auto& [path, translation] : betterOnes) {
        WriteTranslations(path, std::wstring(L"[Cancel]\r\n[") + translation + L"]\r\n");
        ClearTranslationCache();
        EXPECT_EQ(FindTranslationFile(modulePath_, kGerman), path.wstring());
        EXPECT_EQ(German(L"Cancel"), translation);
    }
    // Another language never sees the German folder.
    EXPECT_EQ(FindTranslationFile(modulePath_, MAKELANGID(LANG_FRENCH, SUBLANG_FRENCH)),
              moduleNamed.wstring());
}

TEST_F(TranslationFolder, FileIsLoadedOncePerProcess) {
    const fs::path file = directory_ / L"ShellExt.txt";
    WriteTranslations(file, L"[Cancel]\r\n[Abbrechen]\r\n");
    EXPECT_EQ(German(L"Cancel"), L"Abbrechen");
    WriteTranslations(file, L"[Cancel]\r\n[Verwerfen]\r\n");
    EXPECT_EQ(German(L"Cancel"), L"Abbrechen");
    ClearTranslationCache();
    EXPECT_EQ(German(L"Cancel"), L"Verwerfen");
}

TEST_F(TranslationFolder, FilesThatCannotBeReadFallBackToEnglish) {
    // The parser's own rejections (short, big-endian, cut files) are proved by its portable tests.
    const fs::path file = directory_ / L"ShellExt.txt";
    TranslationMap map;
    WriteBytes(file, "");
    EXPECT_EQ(LoadTranslationFile(file.wstring(), map), E_FAIL) << "an empty file cannot be mapped";
    EXPECT_EQ(German(L"Cancel@@note"), L"Cancel");
    WriteBytes(file, std::string("\xFE\xFF\0[\0C\0]", 8));
    ClearTranslationCache();
    EXPECT_EQ(LoadTranslationFile(file.wstring(), map), E_FAIL);
    EXPECT_EQ(German(L"Cancel@@note"), L"Cancel");
    EXPECT_EQ(LoadTranslationFile((directory_ / L"missing.txt").wstring(), map),
              HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND));
    EXPECT_TRUE(map.empty());
}

TEST(UiLanguage, SelectedLanguageIsThisThreadsAndChoosesTheTexts) {
    const LANGID before = UiLanguage();
    std::wstring inGerman, inEnglish;
    std::thread worker([&] {
        ASSERT_TRUE(SelectUiLanguage(kGerman));
        EXPECT_EQ(UiLanguage(), kGerman);
        inGerman = LoadUiText(IDS_CANCEL);
        ASSERT_TRUE(SelectUiLanguage(kEnglishLanguage));
        inEnglish = LoadUiText(IDS_CANCEL);
    });
    worker.join();
    EXPECT_EQ(inGerman, L"Abbrechen");
    EXPECT_EQ(inEnglish, L"Cancel");
    EXPECT_EQ(UiLanguage(), before);
}
