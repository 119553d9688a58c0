// The error log's entries, read back from a scratch folder as a support technician would.
#include <gtest/gtest.h>

#include <windows.h>
#include <oleauto.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <set>
#include <thread>
#include <vector>

#include "support/error_handling.h"
#include "support/module_instance.h"
#include "support/unique_resource.h"

namespace fs = std::filesystem;
using Microsoft::WRL::ComPtr;
using Lines = std::vector<std::wstring>;

namespace {

constexpr HRESULT kOwnResult = static_cast<HRESULT>(0xA0041234);  // customer bit: no system text
const std::wstring kAccessDenied = L"System description: " + SystemMessageText(ERROR_ACCESS_DENIED);

int g_macroLine = 0;
HRESULT FailThroughMacro() {
    g_macroLine = __LINE__ + 1;
    RETURN_IF_FAILED(E_ACCESSDENIED);
    return S_OK;
}

ComPtr<IErrorInfo> SetThreadErrorInfo(const wchar_t* description) {
    ComPtr<ICreateErrorInfo> create;
    ComPtr<IErrorInfo> info;
    EXPECT_EQ(S_OK, ::CreateErrorInfo(&create));
    create->SetDescription(const_cast<wchar_t*>(description));
    create.As(&info);
    ::SetErrorInfo(0, info.Get());
    return info;
}

// A log's entries, each without its time stamp line; the file must start with a byte-order mark.
std::vector<Lines> ReadEntries(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    const std::string bytes{std::istreambuf_iterator<char>(file), {}};
    EXPECT_EQ(0, bytes.compare(0, 2, "\xFF\xFE")) << "a UTF-16 LE byte-order mark";
    std::wstring text(bytes.size() / 2, L'\0');
    memcpy(text.data(), bytes.data(), text.size() * 2);
    const std::wregex stamp(
        L"\\d{4}-\\d\\d-\\d\\d \\d\\d:\\d\\d:\\d\\d\\.\\d{3}, process \\d+, thread \\d+");
    std::vector<Lines> entries;
    for (size_t at = 1, end; at < text.size(); at = end + 2) {
        end = text.find(L"\r\n", at);
        EXPECT_NE(std::wstring::npos, end) << "every line ends with CR LF";
        const std::wstring line = text.substr(at, end - at);
        if (std::regex_match(line, stamp))
            entries.emplace_back();
        else if (entries.empty())
            ADD_FAILURE() << "an entry without its time stamp";
        else
            entries.back().push_back(line);
    }
    return entries;
}

class ErrorLog : public testing::Test {
protected:
    ErrorLog() { ::SetEnvironmentVariableW(L"LVSHELLEXT_LOG_DIR", folder_.c_str()); }
    ~ErrorLog() override {
        ::SetEnvironmentVariableW(L"LVSHELLEXT_LOG_DIR", nullptr);
        SetErrorLogSizeLimit(kErrorLogDefaultSizeLimit);
        std::error_code ignored;
        fs::remove_all(folder_, ignored);
    }
    const fs::path folder_ = fs::temp_directory_path() / L"lv-error-log-test";
    const fs::path log_ = folder_ / L"LVShellExt.log";
};

TEST_F(ErrorLog, EntryHoldsTheFirstLineAndEachDescriptionPresent) {
    ASSERT_NE(L"System description: ", kAccessDenied);
    const std::wstring denied = L"SourceParser - 0x80070005 (TSourceParser::Parse, 120)";
    const std::wstring own = L"SourceParser - 0xA0041234 (TSourceParser::Parse, 120)";
    const struct {
        HRESULT result;
        const wchar_t *errorInfo, *internal;
        Lines expected;
    } cases[] = {
        {E_ACCESSDENIED, nullptr, nullptr, {denied, kAccessDenied}},
        {kOwnResult, nullptr, L"no HDROP", {own, L"Internal description: no HDROP"}},
        {E_ACCESSDENIED,
         L"by the object",
         L"all",
         {denied, kAccessDenied, L"IErrorInfo description: by the object",
          L"Internal description: all"}},
        {kOwnResult, nullptr, L"two\r\nlines", {own, L"Internal description: two  lines"}},
    };
    for (const auto& test : cases) {
        fs::remove_all(folder_);
        if (test.errorInfo)
            SetThreadErrorInfo(test.errorInfo);
        ReportError(L"SourceParser", test.result, L"TSourceParser::Parse", 120, test.internal);
        ::SetErrorInfo(0, nullptr);
        EXPECT_EQ(std::vector<Lines>{test.expected}, ReadEntries(log_)) << test.expected.back();
    }
}

TEST_F(ErrorLog, ReportLeavesTheThreadsErrorInfoAndLastError) {
    const ComPtr<IErrorInfo> info = SetThreadErrorInfo(L"for the caller");
    ::SetLastError(ERROR_BAD_UNIT);
    ReportError(L"Source", E_FAIL, L"Function", 1);
    EXPECT_EQ(static_cast<DWORD>(ERROR_BAD_UNIT), ::GetLastError());
    ComPtr<IErrorInfo> left;
    EXPECT_EQ(S_OK, ::GetErrorInfo(0, &left));
    EXPECT_EQ(info.Get(), left.Get());
}

TEST_F(ErrorLog, ResultMacroNamesTheFileWithoutItsFolders) {
    EXPECT_EQ(E_ACCESSDENIED, FailThroughMacro());
    const std::vector<Lines> entries = ReadEntries(log_);
    ASSERT_EQ(1u, entries.size());
    EXPECT_EQ(L"error_log_test.cpp - 0x80070005 (FailThroughMacro, " +
                  std::to_wstring(g_macroLine) + L")",
              entries[0].at(0));
}

TEST_F(ErrorLog, FullLogIsMovedAsideAndANewOneStarted) {
    constexpr DWORD kLimit = 600;  // three entries of about 180 bytes
    SetErrorLogSizeLimit(kLimit);
    for (int number = 10; number < 30; ++number)
        ReportError(L"Source", kOwnResult, L"Function", number);
    std::vector<Lines> entries = ReadEntries(folder_ / L"LVShellExt.old.log");
    EXPECT_LE(fs::file_size(folder_ / L"LVShellExt.old.log"), kLimit);
    EXPECT_LE(fs::file_size(log_), kLimit);
    const std::vector<Lines> newer = ReadEntries(log_);
    entries.insert(entries.end(), newer.begin(), newer.end());
    ASSERT_LT(entries.size(), 20u) << "the oldest entries went with a replaced file";
    for (size_t i = 0; i < entries.size(); ++i)
        EXPECT_EQ(Lines{L"Source - 0xA0041234 (Function, " +
                        std::to_wstring(30 - entries.size() + i) + L")"},
                  entries[i]);
}

TEST_F(ErrorLog, ConcurrentReportsLeaveOnlyWholeEntries) {
    std::multiset<Lines> expected;
    std::vector<std::thread> threads;
    for (int thread = 0; thread < 8; ++thread) {
        for (int entry = 0; entry < 40; ++entry)
            expected.insert({L"Threads - 0xA0041234 (Worker, " + std::to_wstring(thread) + L")",
                             L"Internal description: entry " + std::to_wstring(entry)});
        threads.emplace_back([thread] {
            for (int entry = 0; entry < 40; ++entry)
                ReportError(L"Threads", kOwnResult, L"Worker", thread,
                            (L"entry " + std::to_wstring(entry)).c_str());
        });
    }
    for (std::thread& thread : threads)
        thread.join();
    const std::vector<Lines> entries = ReadEntries(log_);
    EXPECT_EQ(expected, std::multiset<Lines>(entries.begin(), entries.end()));
}

TEST_F(ErrorLog, PathIsInTheLocalApplicationDataFolderUnlessOverridden) {
    EXPECT_EQ(log_, fs::path(ErrorLogPath()));
    ::SetEnvironmentVariableW(L"LVSHELLEXT_LOG_DIR", nullptr);
    PWSTR localAppData = nullptr;
    ASSERT_EQ(S_OK, ::SHGetKnownFolderPath(FOLDERID_LocalAppData, 0, nullptr, &localAppData));
    const UniqueCoTaskMem owner(localAppData);
    EXPECT_EQ(std::wstring(localAppData) + L"\\Quorvel\\Digital Levels\\LVShellExt.log",
              ErrorLogPath());
}

}  // namespace
