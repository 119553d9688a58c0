// Faults of the station store made real: a store key whose access list lets everyone read it and
// nobody change it (as a policy or another program can leave a key; the registry refuses the
// write itself, as Wine's server does too), and an error log of the test's own to read back.
#pragma once

#include <windows.h>
#include <sddl.h>

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "stations/station_store.h"
#include "support/error_log.h"
#include "support/unique_resource.h"

// The key under the (overridden) current user, read-only for everyone until destroyed or Allow();
// its own access list is put back then. path "" is the Stations key, else one station's subkey.
class WriteRefusingKey {
public:
    explicit WriteRefusingKey(const std::wstring& subkey = L"") {
        const std::wstring path =
            subkey.empty() ? StationsKeyPath() : StationsKeyPath() + L"\\" + subkey;
        // Opened for its access list before it is locked: this handle can always unlock it.
        EXPECT_EQ(ERROR_SUCCESS,
                  ::RegCreateKeyExW(HKEY_CURRENT_USER, path.c_str(), 0, nullptr, 0,
                                    READ_CONTROL | WRITE_DAC, nullptr, key_.put(), nullptr));
        DWORD size = 0;
        (void)::RegGetKeySecurity(key_.get(), DACL_SECURITY_INFORMATION, nullptr, &size);
        original_.resize(size);
        EXPECT_EQ(ERROR_SUCCESS, ::RegGetKeySecurity(key_.get(), DACL_SECURITY_INFORMATION,
                                                     original_.data(), &size));
        SetAccessList(L"D:P(A;;KR;;;WD)");  // everyone: read; no one: anything else
        UniqueRegKey probe;
        EXPECT_EQ(ERROR_ACCESS_DENIED,
                  ::RegOpenKeyExW(HKEY_CURRENT_USER, path.c_str(), 0, KEY_SET_VALUE, probe.put()))
            << "the registry does not enforce the key's access list";
    }
    WriteRefusingKey(const WriteRefusingKey&) = delete;
    WriteRefusingKey& operator=(const WriteRefusingKey&) = delete;
    ~WriteRefusingKey() { Allow(); }

    void Allow() {
        if (original_.empty())
            return;
        EXPECT_EQ(ERROR_SUCCESS,
                  ::RegSetKeySecurity(key_.get(), DACL_SECURITY_INFORMATION, original_.data()));
        original_.clear();
    }

private:
    void SetAccessList(const wchar_t* sddl) {
        PSECURITY_DESCRIPTOR descriptor = nullptr;
        ASSERT_TRUE(::ConvertStringSecurityDescriptorToSecurityDescriptorW(sddl, SDDL_REVISION_1,
                                                                           &descriptor, nullptr));
        const UniqueLocalMemory owner(descriptor);
        EXPECT_EQ(ERROR_SUCCESS,
                  ::RegSetKeySecurity(key_.get(), DACL_SECURITY_INFORMATION, descriptor));
    }

    UniqueRegKey key_;
    std::vector<BYTE> original_;
};

// Points the error log at a folder of the test's own for its life; Text() reads what was logged.
class ScopedErrorLog {
public:
    ScopedErrorLog() {
        wchar_t temporary[MAX_PATH] = {};
        EXPECT_NE(0u, ::GetTempPathW(MAX_PATH, temporary));
        GUID guid{};
        EXPECT_EQ(S_OK, ::CoCreateGuid(&guid));
        wchar_t unique[64] = {};
        ::StringFromGUID2(guid, unique, ARRAYSIZE(unique));
        folder_ = std::wstring(temporary) + L"lv-log-" + unique;
        EXPECT_TRUE(::CreateDirectoryW(folder_.c_str(), nullptr));
        ::SetEnvironmentVariableW(L"LVSHELLEXT_LOG_DIR", folder_.c_str());
        path_ = ErrorLogPath();
    }
    ScopedErrorLog(const ScopedErrorLog&) = delete;
    ScopedErrorLog& operator=(const ScopedErrorLog&) = delete;
    ~ScopedErrorLog() {
        ::SetEnvironmentVariableW(L"LVSHELLEXT_LOG_DIR", nullptr);
        (void)::DeleteFileW(path_.c_str());
        (void)::RemoveDirectoryW(folder_.c_str());
    }

    // Everything logged so far (UTF-16 text); empty when nothing was.
    std::wstring Text() const {
        std::wstring text;
        UniqueFileHandle file(::CreateFileW(path_.c_str(), GENERIC_READ,
                                            FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr,
                                            OPEN_EXISTING, 0, nullptr));
        if (!file)
            return text;
        text.resize(::GetFileSize(file.get(), nullptr) / sizeof(wchar_t));
        DWORD read = 0;
        (void)::ReadFile(file.get(), text.data(), static_cast<DWORD>(text.size() * sizeof(wchar_t)),
                         &read, nullptr);
        text.resize(read / sizeof(wchar_t));
        return text;
    }

private:
    std::wstring folder_;
    std::wstring path_;
};
