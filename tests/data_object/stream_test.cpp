// The read-once stream: reads to the end, deletes the file at the short read, and keeps its size.
#include <windows.h>

#include <gtest/gtest.h>

#include <cstring>
#include <fstream>
#include <utility>
#include <vector>

#include "support/module_lock.h"
#include "tests/data_object/data_object_fixture.h"
#include "view/stream2.h"

namespace {

// A temporary file of size bytes "ABC...ZAB...".
std::wstring WriteTemporaryFile(size_t size) {
    wchar_t directory[MAX_PATH], path[MAX_PATH];
    ::GetTempPathW(MAX_PATH, directory);
    ::GetTempFileNameW(directory, L"TST", 0, path);
    std::ofstream file(std::filesystem::path(path), std::ios::binary);
    for (size_t i = 0; i < size; ++i)
        file.put(static_cast<char>('A' + i % 26));
    return path;
}

}  // namespace

TEST(Stream2, ExactMultipleNeedsAThirdReadBeforeTheFileIsGone) {
    const std::wstring path = WriteTemporaryFile(8192);
    {
        auto stream = MakeComObject<CStream2>();
        ASSERT_EQ(S_OK, stream->Bind(path, true));
        // Two full reads do not yet show the end; the third gives nothing and deletes the file,
        // and a finished stream gives nothing more.
        const std::pair<ULONG, bool> reads[] = {{4096, true}, {4096, true}, {0, false}, {0, false}};
        std::vector<char> buffer(4096);
        for (const auto& [expected, exists] : reads) {
            ULONG got = 1;
            ASSERT_EQ(S_OK, stream->Read(buffer.data(), 4096, &got));
            EXPECT_EQ(expected, got);
            EXPECT_EQ(exists, FileExists(path));
        }
        STATSTG statistics{};
        EXPECT_EQ(S_OK, stream->Stat(&statistics, STATFLAG_NONAME));
        EXPECT_EQ(8192u, statistics.cbSize.QuadPart) << "the size taken at binding";
    }
    EXPECT_EQ(0, ModuleLockCount());
}

TEST(Stream2, ReaderThatStopsEarlyTakesTheFileWithItUnlessTheStreamMayNotDeleteIt) {
    for (const bool mayDelete : {true, false}) {
        const std::wstring path = WriteTemporaryFile(100);
        {
            auto stream = MakeComObject<CStream2>();
            ASSERT_EQ(S_OK, stream->Bind(path, mayDelete));
            char buffer[10];
            ULONG got = 0;
            ASSERT_EQ(S_OK, stream->Read(buffer, 10, &got));
            EXPECT_TRUE(FileExists(path));
        }
        EXPECT_EQ(!mayDelete, FileExists(path)) << "a download nobody will finish reading goes";
        ::DeleteFileW(path.c_str());
    }
}

TEST(Stream2, StatFillsTheWholeRecordAndNamesTheFileOnlyWhenAsked) {
    const std::wstring path = WriteTemporaryFile(300);
    auto stream = MakeComObject<CStream2>();
    ASSERT_EQ(S_OK, stream->Bind(path, true));
    STATSTG statistics;
    memset(&statistics, 0xCD, sizeof statistics);
    ASSERT_EQ(S_OK, stream->Stat(&statistics, STATFLAG_NONAME));
    EXPECT_EQ(nullptr, statistics.pwcsName);
    EXPECT_EQ(static_cast<DWORD>(STGTY_STREAM), statistics.type);
    EXPECT_EQ(300u, statistics.cbSize.QuadPart);
    EXPECT_EQ(0u, statistics.mtime.dwLowDateTime);
    EXPECT_EQ(0u, statistics.grfLocksSupported);

    ASSERT_EQ(S_OK, stream->Stat(&statistics, STATFLAG_DEFAULT));
    ASSERT_NE(nullptr, statistics.pwcsName);
    EXPECT_EQ(path.substr(path.rfind(L'\\') + 1), statistics.pwcsName);
    ::CoTaskMemFree(statistics.pwcsName);  // what a caller does: the copy must be its own
}

TEST(Stream2, MissingFileHasSizeZeroAndReadFailsWithTheWin32ErrorAsAnHresult) {
    auto stream = MakeComObject<CStream2>();
    ASSERT_EQ(S_OK, stream->Bind(L"C:\\no such folder\\QRV1.tmp", true));
    STATSTG statistics{};
    ASSERT_EQ(S_OK, stream->Stat(&statistics, STATFLAG_NONAME));
    EXPECT_EQ(0u, statistics.cbSize.QuadPart);
    char buffer[4];
    ULONG got = 7;
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_PATH_NOT_FOUND), stream->Read(buffer, 4, &got))
        << "the bare code 3 would read as success";
    EXPECT_EQ(0u, got);
    EXPECT_EQ(E_NOTIMPL, stream->Write(buffer, 4, &got));
    EXPECT_EQ(S_OK, stream->Seek({}, STREAM_SEEK_SET, nullptr));
}
