// The read-once stream: reads to the end, deletes the file at the short read, and keeps its size.
#include <windows.h>

#include <gtest/gtest.h>

#include <climits>
#include <cstring>
#include <fstream>
#include <utility>
#include <vector>

#include <wrl/client.h>

#include "support/module_lock.h"
#include "support/unique_resource.h"
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

TEST(Stream2, FileThatCannotBeOpenedIsNoStream) {
    auto stream = MakeComObject<CStream2>();
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_PATH_NOT_FOUND),
              stream->Bind(L"C:\\no such folder\\QRV1.tmp", true))
        << "an empty stream would pass for an empty download";
    char buffer[4];
    ULONG got = 7;
    EXPECT_TRUE(FAILED(stream->Read(buffer, 4, &got)));
    EXPECT_EQ(0u, got);
    EXPECT_EQ(E_NOTIMPL, stream->Write(buffer, 4, &got));
}

namespace {

constexpr size_t kStreamSize = 1000;
constexpr uint64_t kUnchanged = UINT64_MAX;

// One call on the stream and what it must give: the HRESULT, the position Seek reports or the
// count Read gives (Read's bytes must be the file's from `from`), and whether the file is there.
struct StreamStep {
    enum Kind { kSeek, kRead } kind;
    LONGLONG move;  // Seek: the move; Read: unused
    DWORD origin;   // Seek: the origin; Read: the bytes asked for
    HRESULT result;
    uint64_t expected;  // Seek: the position reported; Read: the count
    uint64_t from;      // Read: where the bytes come from in the file
    bool fileAfter;
};

StreamStep Seek(LONGLONG move, DWORD origin, HRESULT result, uint64_t position, bool file = true) {
    return {StreamStep::kSeek, move, origin, result, position, 0, file};
}
StreamStep Read(ULONG wanted, uint64_t got, uint64_t from, bool file = true) {
    return {StreamStep::kRead, 0, wanted, S_OK, got, from, file};
}

struct StreamScenario {
    const char* what;
    std::vector<StreamStep> steps;
    bool mayDelete = true;  // what the stream is bound with
};

// After the end a file that comes under the same name (the next download may be given it) is not
// the stream's: nothing of it is read, and it is not deleted a second time when the stream goes.
// Before the end, letting the stream go takes the file with it, unless it may not delete it.
void LetGo(Microsoft::WRL::ComPtr<CStream2>& stream, const std::wstring& path, bool mayDelete) {
    const bool ended = !FileExists(path);
    if (ended) {
        std::ofstream(std::filesystem::path(path)) << "the next download";
        char byte;
        ULONG got = 1;
        EXPECT_EQ(S_OK, stream->Read(&byte, 1, &got));
        EXPECT_EQ(0u, got);
    }
    stream.Reset();
    EXPECT_EQ(ended || !mayDelete, FileExists(path))
        << (ended ? "deleted a second time" : "a download nobody will finish reading stays");
    EXPECT_EQ(0, ModuleLockCount());
    ::DeleteFileW(path.c_str());
}

}  // namespace

// Every origin of Seek before, during and after the read, as a copy engine uses them: sizing the
// stream by seeking to its end and back, reading from the middle, and seeking after the end.
TEST(Stream2, ReadAndSeekMoveWithinTheFileAndFailWhereTheyCannotBeHonoured) {
    const StreamScenario scenarios[] = {
        // Full reads do not yet show the end; the next gives nothing and deletes the file, and a
        // finished stream gives nothing more.
        {"an exact multiple of the reads",
         {Read(500, 500, 0), Read(500, 500, 500), Read(500, 0, 0, false), Read(500, 0, 0, false)}},
        {"let go half way by a stream that may not delete", {Read(10, 10, 0)}, false},
        {"sized by seeking to the end and back, then read whole",
         {Seek(0, STREAM_SEEK_END, S_OK, kStreamSize), Seek(0, STREAM_SEEK_SET, S_OK, 0),
          Read(600, 600, 0), Read(600, 400, 600, false)}},
        {"each origin before the first read",
         {Seek(10, STREAM_SEEK_SET, S_OK, 10), Seek(5, STREAM_SEEK_CUR, S_OK, 15),
          Seek(-10, STREAM_SEEK_END, S_OK, kStreamSize - 10), Seek(-1, STREAM_SEEK_SET,
          STG_E_INVALIDFUNCTION, kUnchanged), Seek(0, 7, STG_E_INVALIDFUNCTION, kUnchanged),
          Seek(0, STREAM_SEEK_CUR, S_OK, kStreamSize - 10), Read(20, 10, kStreamSize - 10, false)}},
        {"during the read: back, forward and relative",
         {Read(100, 100, 0), Seek(0, STREAM_SEEK_CUR, S_OK, 100), Seek(50, STREAM_SEEK_SET, S_OK, 50),
          Read(10, 10, 50), Seek(-30, STREAM_SEEK_CUR, S_OK, 30), Read(5, 5, 30),
          Seek(LLONG_MIN, STREAM_SEEK_CUR, STG_E_INVALIDFUNCTION, kUnchanged)}},
        {"past the end reads nothing and ends the stream",
         {Seek(5, STREAM_SEEK_END, S_OK, kStreamSize + 5), Read(10, 0, 0, false)}},
        {"after the end only staying put is honoured",
         {Read(2000, kStreamSize, 0, false), Seek(0, STREAM_SEEK_CUR, S_OK, kStreamSize, false),
          Seek(0, STREAM_SEEK_END, S_OK, kStreamSize, false),
          Seek(0, STREAM_SEEK_SET, STG_E_INVALIDFUNCTION, kUnchanged, false),
          Seek(-1, STREAM_SEEK_CUR, STG_E_INVALIDFUNCTION, kUnchanged, false),
          Read(10, 0, 0, false)}},
    };
    for (const StreamScenario& scenario : scenarios) {
        SCOPED_TRACE(scenario.what);
        const std::wstring path = WriteTemporaryFile(kStreamSize);
        auto stream = MakeComObject<CStream2>();
        ASSERT_EQ(S_OK, stream->Bind(path, scenario.mayDelete));
        for (size_t index = 0; index < scenario.steps.size(); ++index) {
            const StreamStep& step = scenario.steps[index];
            SCOPED_TRACE(index);
            if (step.kind == StreamStep::kSeek) {
                ULARGE_INTEGER position;
                position.QuadPart = 0xDEADBEEF;
                LARGE_INTEGER move;
                move.QuadPart = step.move;
                EXPECT_EQ(step.result, stream->Seek(move, step.origin, &position));
                if (step.expected != kUnchanged) {
                    EXPECT_EQ(step.expected, position.QuadPart);
                }
            } else {
                std::vector<char> buffer(step.origin);
                ULONG got = 0xFFFF;
                EXPECT_EQ(step.result, stream->Read(buffer.data(), step.origin, &got));
                ASSERT_EQ(step.expected, got);
                for (ULONG i = 0; i < got; ++i)
                    ASSERT_EQ(static_cast<char>('A' + (step.from + i) % 26), buffer[i]) << i;
            }
            EXPECT_EQ(step.fileAfter, FileExists(path));
        }
        STATSTG statistics{};
        EXPECT_EQ(S_OK, stream->Stat(&statistics, STATFLAG_NONAME));
        EXPECT_EQ(kStreamSize, statistics.cbSize.QuadPart) << "the size outlives the file";
        LetGo(stream, path, scenario.mayDelete);
    }
}

// CopyTo of the whole stream and of parts; a copy that takes the last byte ends the stream.
TEST(Stream2, CopyToCopiesFromThePositionAndEndsTheStreamAtTheLastByte) {
    struct Copy {
        uint64_t count;
        uint64_t copied;
        bool fileAfter;
    };
    const struct {
        const char* what;
        uint64_t startAt;
        std::vector<Copy> copies;
    } cases[] = {
        {"the whole stream at once", 0, {{UINT64_MAX, kStreamSize, false}}},
        {"exactly the size, with no short read", 0, {{kStreamSize, kStreamSize, false}}},
        {"in two parts", 0, {{400, 400, true}, {UINT64_MAX, kStreamSize - 400, false}}},
        {"the rest after a seek", 300, {{UINT64_MAX, kStreamSize - 300, false}}},
        {"nothing, then the rest", 0, {{0, 0, true}, {UINT64_MAX, kStreamSize, false}}},
        {"more after the end copies nothing", 0,
         {{UINT64_MAX, kStreamSize, false}, {UINT64_MAX, 0, false}}},
    };
    for (const auto& test : cases) {
        SCOPED_TRACE(test.what);
        const std::wstring path = WriteTemporaryFile(kStreamSize);
        auto stream = MakeComObject<CStream2>();
        ASSERT_EQ(S_OK, stream->Bind(path, true));
        LARGE_INTEGER start;
        start.QuadPart = static_cast<LONGLONG>(test.startAt);
        ASSERT_EQ(S_OK, stream->Seek(start, STREAM_SEEK_SET, nullptr));
        Microsoft::WRL::ComPtr<IStream> target;
        ASSERT_EQ(S_OK, ::CreateStreamOnHGlobal(nullptr, TRUE, &target));
        uint64_t total = 0;
        for (const Copy& copy : test.copies) {
            ULARGE_INTEGER count, read, written;
            count.QuadPart = copy.count;
            ASSERT_EQ(S_OK, stream->CopyTo(target.Get(), count, &read, &written));
            EXPECT_EQ(copy.copied, read.QuadPart);
            EXPECT_EQ(copy.copied, written.QuadPart);
            EXPECT_EQ(copy.fileAfter, FileExists(path));
            total += copy.copied;
        }
        STATSTG statistics{};
        ASSERT_EQ(S_OK, target->Stat(&statistics, STATFLAG_NONAME));
        ASSERT_EQ(total, statistics.cbSize.QuadPart);
        HGLOBAL memory = nullptr;
        ASSERT_EQ(S_OK, ::GetHGlobalFromStream(target.Get(), &memory));
        GlobalLockGuard lock(memory);
        const auto* bytes = static_cast<const char*>(lock.data());
        for (uint64_t i = 0; i < total; ++i)
            ASSERT_EQ(static_cast<char>('A' + (test.startAt + i) % 26), bytes[i]) << i;
        LetGo(stream, path, true);
    }
}

// A stream over a download's target removes the target's files and its reservation once,
// whether it was read to its end, copied out, let go half way or never bound to a file at all;
// a file that comes under the name afterwards is not the stream's.
TEST(Stream2, ABoundDownloadGoesWithItsReservationOnceHoweverTheStreamEnds) {
    enum class Ending { kReadToEnd, kCopiedOut, kLetGoHalfWay, kLetGoUnread, kNothingWritten };
    const struct {
        const char* what;
        Ending ending;
        const wchar_t* writtenBeside;  // what the download added to the name, if it wrote there
    } cases[] = {
        {"read to its end", Ending::kReadToEnd, nullptr},
        {"the library's file read to its end", Ending::kReadToEnd, L".txt"},
        {"copied out", Ending::kCopiedOut, nullptr},
        {"let go half way", Ending::kLetGoHalfWay, nullptr},
        {"the library's file let go unread", Ending::kLetGoUnread, L".txt"},
        {"bound to a file the download never wrote", Ending::kNothingWritten, L".txt"},
    };
    for (const auto& test : cases) {
        SCOPED_TRACE(test.what);
        DownloadTarget target;
        ASSERT_EQ(S_OK,
                  DownloadTarget::Create(std::filesystem::temp_directory_path().wstring(), target));
        const std::wstring path = target.Path();
        const std::wstring reservation = target.Reservation();
        const std::wstring written = path + (test.writtenBeside ? test.writtenBeside : L"");
        ASSERT_EQ(S_OK, target.AddWrittenFile(written));
        if (test.ending != Ending::kNothingWritten)
            WriteAsTheLibraryDoes(written, kContent);
        const bool finished =
            test.ending == Ending::kReadToEnd || test.ending == Ending::kCopiedOut;
        {
            auto stream = MakeComObject<CStream2>();
            const HRESULT bound = stream->Bind(std::move(target));
            if (test.ending == Ending::kNothingWritten) {
                EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND), bound);
            } else {
                ASSERT_EQ(S_OK, bound);
                EXPECT_TRUE(FileExists(reservation)) << "the name stays reserved while it is read";
            }
            if (test.ending == Ending::kReadToEnd) {
                EXPECT_EQ(kContent, ReadToEnd(stream.Get()));
            } else if (test.ending == Ending::kCopiedOut) {
                Microsoft::WRL::ComPtr<IStream> copy;
                ASSERT_EQ(S_OK, ::CreateStreamOnHGlobal(nullptr, TRUE, &copy));
                ULARGE_INTEGER all;
                all.QuadPart = UINT64_MAX;
                ASSERT_EQ(S_OK, stream->CopyTo(copy.Get(), all, nullptr, nullptr));
            } else if (test.ending == Ending::kLetGoHalfWay) {
                char buffer[5];
                ULONG got = 0;
                ASSERT_EQ(S_OK, stream->Read(buffer, sizeof buffer, &got));
                EXPECT_TRUE(FileExists(written));
            }
            if (finished) {
                EXPECT_FALSE(FileExists(written));
                EXPECT_FALSE(FileExists(path));
                EXPECT_FALSE(FileExists(reservation));
                std::ofstream(std::filesystem::path(path)) << "the next download";
            }
        }
        EXPECT_FALSE(FileExists(reservation));
        if (written != path) {
            EXPECT_FALSE(FileExists(written));
        }
        EXPECT_EQ(finished, FileExists(path))
            << (finished ? "deleted a second time" : "left behind");
        ::DeleteFileW(path.c_str());
    }
}
