// The error log's entries, read back from a scratch folder as a support technician would.
#include <gtest/gtest.h>

#include <windows.h>
#include <oleauto.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <future>
#include <iostream>
#include <iterator>
#include <regex>
#include <set>
#include <thread>
#include <vector>

#include "support/error_handling.h"
#include "support/error_log.h"
#include "support/module_instance.h"
#include "support/unique_resource.h"

namespace fs = std::filesystem;
using Microsoft::WRL::ComPtr;
using Lines = std::vector<std::wstring>;

namespace {

constexpr HRESULT kOwnResult = static_cast<HRESULT>(0xA0041234);  // customer bit: no system text
constexpr DWORD kLimit = 600;  // a small log's: three entries of about 180 bytes
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

std::string BytesOf(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

std::wstring Utf16Of(const std::string& bytes) {
    std::wstring text(bytes.size() / 2, L'\0');
    memcpy(text.data(), bytes.data(), text.size() * 2);
    return text;
}

// Where the log of the prefix's user is, when no folder override is read.
std::wstring UsersLogPath() {
    PWSTR localAppData = nullptr;
    EXPECT_EQ(S_OK, ::SHGetKnownFolderPath(FOLDERID_LocalAppData, 0, nullptr, &localAppData));
    const UniqueCoTaskMem owner(localAppData);
    return std::wstring(localAppData) + L"\\Quorvel\\Digital Levels\\LVShellExt.log";
}

// A log's entries, each without its time stamp line; the file must start with a byte-order mark.
std::vector<Lines> ReadEntries(const fs::path& path) {
    const std::string bytes = BytesOf(path);
    EXPECT_EQ(0, bytes.compare(0, 2, "\xFF\xFE")) << "a UTF-16 LE byte-order mark";
    const std::wstring text = Utf16Of(bytes);
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

// The entry is written without disturbing the caller: its thread's error object and last error
// are as they were.
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
        SCOPED_TRACE(testing::Message() << test.expected.back());
        fs::remove_all(folder_);
        const ComPtr<IErrorInfo> info = test.errorInfo ? SetThreadErrorInfo(test.errorInfo) : nullptr;
        ::SetLastError(ERROR_BAD_UNIT);
        ReportError(L"SourceParser", test.result, L"TSourceParser::Parse", 120, test.internal);
        EXPECT_EQ(static_cast<DWORD>(ERROR_BAD_UNIT), ::GetLastError());
        ComPtr<IErrorInfo> left;  // taken, which leaves none for the next case
        EXPECT_EQ(info ? S_OK : S_FALSE, ::GetErrorInfo(0, &left));
        EXPECT_EQ(info.Get(), left.Get());
        EXPECT_EQ(std::vector<Lines>{test.expected}, ReadEntries(log_));
    }
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
    EXPECT_EQ(UsersLogPath(), ErrorLogPath());
}

// A program of its own beside this one (tests/error_log/error_log_helper.cpp), started with the
// arguments given; ends it when the test ends.
class Helper {
public:
    explicit Helper(const std::wstring& arguments) {
        wchar_t self[MAX_PATH] = {};
        ::GetModuleFileNameW(nullptr, self, MAX_PATH);
        std::wstring command = L"\"" +
                               (fs::path(self).parent_path() / L"error_log_helper.exe").wstring() +
                               L"\" " + arguments;
        STARTUPINFOW startup{};
        startup.cb = sizeof startup;
        PROCESS_INFORMATION started{};
        EXPECT_TRUE(::CreateProcessW(nullptr, command.data(), nullptr, nullptr, FALSE, 0, nullptr,
                                     nullptr, &startup, &started))
            << ::GetLastError();
        process_.reset(started.hProcess);
        UniqueHandle thread(started.hThread);
    }
    ~Helper() {
        if (process_ && ::WaitForSingleObject(process_.get(), 0) == WAIT_TIMEOUT)
            ::TerminateProcess(process_.get(), 1);
    }
    HANDLE process() const { return process_.get(); }
    // Its exit code once it has ended within the watchdog's time; -1 otherwise.
    int ExitCode() const {
        DWORD code = 0;
        if (::WaitForSingleObject(process_.get(), 20000) != WAIT_OBJECT_0 ||
            !::GetExitCodeProcess(process_.get(), &code))
            return -1;
        return static_cast<int>(code);
    }

private:
    UniqueHandle process_;
};

// A second process that holds the log's mutex until released (or ended).
class MutexHolder {
public:
    MutexHolder()
        : ready_(::CreateEventW(nullptr, TRUE, FALSE, EventName(L"ready").c_str())),
          release_(::CreateEventW(nullptr, TRUE, FALSE, EventName(L"release").c_str())),
          helper_(L"hold " + EventName(L"ready") + L" " + EventName(L"release")) {
        const HANDLE either[] = {ready_.get(), helper_.process()};
        holding_ = ::WaitForMultipleObjects(2, either, FALSE, 20000) == WAIT_OBJECT_0;
    }
    ~MutexHolder() { Release(); }
    bool holding() const { return holding_; }
    // Lets it go and waits for its end; true when it ended on its own.
    bool Release() {
        ::SetEvent(release_.get());
        return helper_.ExitCode() == 0;
    }
    // Ends it while it holds the mutex, which is then abandoned.
    void Kill() {
        ::TerminateProcess(helper_.process(), 9);
        ::WaitForSingleObject(helper_.process(), 20000);
    }

private:
    static std::wstring EventName(const wchar_t* what) {
        return L"Local\\lv-error-log-test-" + std::wstring(what) + L"-" +
               std::to_wstring(::GetCurrentProcessId());
    }

    UniqueHandle ready_, release_;
    Helper helper_;
    bool holding_ = false;
};

TEST_F(ErrorLog, WhileAnotherProcessHoldsTheLogEntriesAreDroppedAndCallersGoOn) {
    {
        MutexHolder holder;
        ASSERT_TRUE(holder.holding());
        // A drop of ten missing paths, logged on the caller's thread; the watchdog turns a frozen
        // caller into a failure (each of the ten would otherwise wait for the holder).
        std::packaged_task<void()> failures([] {
            for (int number = 0; number < 10; ++number)
                ReportError(L"Held", kOwnResult, L"Drop", number);
        });
        std::future<void> done = failures.get_future();
        const auto started = std::chrono::steady_clock::now();
        std::thread caller(std::move(failures));
        const bool returned = done.wait_for(std::chrono::seconds(10)) == std::future_status::ready;
        const auto elapsed = std::chrono::duration_cast<std::chrono::milliseconds>(
            std::chrono::steady_clock::now() - started);
        EXPECT_TRUE(returned) << "ten entries kept the caller waiting";
        EXPECT_TRUE(holder.Release());
        caller.join();
        std::cout << "[ figure ] ten entries while the log was held: " << elapsed.count()
                  << " ms\n";
        EXPECT_FALSE(fs::exists(log_)) << "the entries are dropped, not written past the lock";
    }
    // Released: the next entry is written at once, and it is the only one.
    ReportError(L"Held", kOwnResult, L"Drop", 99);
    EXPECT_EQ(std::vector<Lines>{{L"Held - 0xA0041234 (Drop, 99)"}}, ReadEntries(log_));
}

TEST_F(ErrorLog, AMutexAbandonedByADeadProcessIsTakenOver) {
    MutexHolder holder;
    ASSERT_TRUE(holder.holding());
    holder.Kill();
    ReportError(L"Abandoned", kOwnResult, L"Drop", 1);
    EXPECT_EQ(std::vector<Lines>{{L"Abandoned - 0xA0041234 (Drop, 1)"}}, ReadEntries(log_));
}

TEST_F(ErrorLog, AFullLogThatCannotBeMovedStopsGrowingAtTwiceTheLimit) {
    SetErrorLogSizeLimit(kLimit);
    ReportError(L"Source", kOwnResult, L"Function", 0);
    // A reader that does not share delete: the file cannot be moved aside while it is open.
    UniqueFileHandle reader(::CreateFileW(log_.c_str(), GENERIC_READ,
                                          FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr,
                                          OPEN_EXISTING, 0, nullptr));
    ASSERT_TRUE(reader);
    for (int number = 1; number < 40; ++number)
        ReportError(L"Source", kOwnResult, L"Function", number);
    EXPECT_FALSE(fs::exists(folder_ / L"LVShellExt.old.log")) << "the reader kept the file";
    EXPECT_GT(fs::file_size(log_), kLimit);
    EXPECT_LE(fs::file_size(log_), 2 * kLimit);
    const std::vector<Lines> kept = ReadEntries(log_);  // whole entries, the oldest ones
    ASSERT_GE(kept.size(), 4u);
    for (size_t i = 0; i < kept.size(); ++i)
        EXPECT_EQ(Lines{L"Source - 0xA0041234 (Function, " + std::to_wstring(i) + L")"}, kept[i]);

    // The reader is gone: the next entry moves the full file aside and starts a new one.
    reader.reset();
    ReportError(L"Source", kOwnResult, L"Function", 40);
    EXPECT_EQ(kept, ReadEntries(folder_ / L"LVShellExt.old.log"));
    EXPECT_EQ(std::vector<Lines>{{L"Source - 0xA0041234 (Function, 40)"}}, ReadEntries(log_));
}

// The UTF-16 text of the variable's name, as a module holds it when it reads the variable.
bool HoldsTheOverrideName(const fs::path& module) {
    const std::string bytes = BytesOf(module);
    std::string name;
    for (char c : std::string("LVSHELLEXT_LOG_DIR"))
        name += {c, '\0'};
    EXPECT_GT(bytes.size(), 4096u) << module;
    return bytes.find(name) != std::string::npos;
}

TEST_F(ErrorLog, OnlyTestProgramsReadTheFolderOverride) {
    // A program built as the DLL is, with the variable set (and inherited), logs where the user's
    // own log is.
    fs::create_directories(folder_);
    const fs::path answer = folder_ / L"path.txt";
    Helper helper(L"path \"" + answer.wstring() + L"\"");
    ASSERT_EQ(0, helper.ExitCode());
    EXPECT_EQ(UsersLogPath(), Utf16Of(BytesOf(answer)));

    // The shipped DLL has no trace of the variable; this test program, which reads it, has.
    const std::string host = LV_EXTENSION_DLL_PATH;
    std::wstring dll = host.front() == '/' ? L"Z:" : L"";
    for (char c : host)
        dll.push_back(c == '/' ? L'\\' : static_cast<wchar_t>(c));
    EXPECT_FALSE(HoldsTheOverrideName(dll));
    wchar_t self[MAX_PATH] = {};
    ::GetModuleFileNameW(nullptr, self, MAX_PATH);
    EXPECT_TRUE(HoldsTheOverrideName(self));
}

}  // namespace
