// The download's target file: reserved, created new, held against deleting and renaming, written
// by the serial driver's own output file, and gone with its reservation after the stream's end.
#include <windows.h>

#include <gtest/gtest.h>

#include <cwchar>
#include <filesystem>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "download/download_target.h"
#include "tests/data_object/data_object_fixture.h"
#include "view/stream2.h"

// The fixture's folder of download records stands in for the temporary folder.
class DownloadTargets : public DataObject {
protected:
    std::wstring Folder() const { return records_.wstring() + L"\\"; }
};

// Each target owns a name no other has, however many are prepared and from how many threads.
TEST_F(DownloadTargets, TargetsPreparedAtOnceGetNamesOfTheirOwn) {
    constexpr int kRounds = 20;
    std::vector<DownloadTarget> targets(2 * kRounds);
    for (int round = 0; round < kRounds; ++round) {
        // A manual-reset event as the starting gun: this toolchain's std::latch waits through
        // libstdc++'s atomic wait, which on Windows can miss its wake-up and hang the test.
        const UniqueHandle start(::CreateEventW(nullptr, TRUE, FALSE, nullptr));
        ASSERT_NE(nullptr, start.get());
        HRESULT results[2] = {E_FAIL, E_FAIL};
        std::thread threads[2];
        for (int side = 0; side < 2; ++side) {
            threads[side] = std::thread([&, side] {
                ::WaitForSingleObject(start.get(), INFINITE);
                results[side] = DownloadTarget::Create(Folder(), targets[2 * round + side]);
            });
        }
        ::SetEvent(start.get());
        for (std::thread& thread : threads)
            thread.join();
        ASSERT_EQ(S_OK, results[0]);
        ASSERT_EQ(S_OK, results[1]);
    }
    std::set<std::wstring> paths;
    for (const DownloadTarget& target : targets) {
        EXPECT_TRUE(paths.insert(target.Path()).second) << "shared: " << target.Path();
        EXPECT_EQ(0u, target.Path().rfind(Folder() + L"QRV", 0)) << target.Path();
        EXPECT_EQ(target.Path(), target.Reservation().substr(0, target.Path().size()));
        EXPECT_TRUE(FileExists(target.Path()));
        EXPECT_TRUE(FileExists(target.Reservation()));
    }
    targets.clear();
    EXPECT_TRUE(FilesIn(records_).empty()) << "files and reservations go with their targets";
}

// Held, the file can be written by the download but not deleted, renamed or replaced by anyone;
// once the stream has read it, it and its reservation are gone, and nothing else is.
TEST_F(DownloadTargets, TheHeldFileIsWrittenAndReadButNeitherDeletedNorRenamed) {
    DownloadTarget target;
    ASSERT_EQ(S_OK, DownloadTarget::Create(Folder(), target));
    const std::wstring path = target.Path();
    const std::wstring reservation = target.Reservation();
    const std::wstring elsewhere = Folder() + L"moved";

    EXPECT_FALSE(::DeleteFileW(path.c_str()));
    EXPECT_EQ(static_cast<DWORD>(ERROR_SHARING_VIOLATION), ::GetLastError());
    EXPECT_FALSE(::MoveFileW(path.c_str(), elsewhere.c_str()));
    EXPECT_FALSE(::MoveFileExW(reservation.c_str(), path.c_str(), MOVEFILE_REPLACE_EXISTING))
        << "another file put in its place";
    EXPECT_FALSE(FileExists(elsewhere));

    WriteAsTheDriverDoes(path, kContent);
    auto stream = MakeComObject<CStream2>();
    ASSERT_EQ(S_OK, stream->Bind(std::move(target)));
    // Bound, the file is read-only to everyone: the bytes read are those the download wrote.
    UniqueFileHandle writer(::CreateFileW(path.c_str(), GENERIC_WRITE,
                                          FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE,
                                          nullptr, OPEN_EXISTING, 0, nullptr));
    EXPECT_FALSE(writer) << "a writer while the stream reads";
    EXPECT_FALSE(::DeleteFileW(path.c_str()));
    EXPECT_EQ(kContent, ReadToEnd(stream.Get()));
    EXPECT_FALSE(FileExists(path));
    EXPECT_FALSE(FileExists(reservation));
    EXPECT_TRUE(FilesIn(records_).empty());
}

// A file that is already under the reserved name, however it came there, is not ours: it is
// neither emptied nor deleted, and the next name is taken.
TEST_F(DownloadTargets, AFileAlreadyUnderTheNameIsNeverOverwritten) {
    const std::wstring reservation = Folder() + L"QRVBEEF.tmp";
    const std::wstring theirs = Folder() + L"QRVBEEF";
    std::ofstream(std::filesystem::path(reservation)).close();
    std::ofstream(std::filesystem::path(theirs), std::ios::binary) << "their survey";
    {
        DownloadTarget target;
        EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_FILE_EXISTS), target.Claim(reservation));
        EXPECT_FALSE(target);
        EXPECT_EQ(L"", target.Path());
    }
    EXPECT_EQ("their survey", ContentOf(theirs));
    EXPECT_FALSE(FileExists(reservation)) << "the reservation was the target's to delete";

    // Through the folder: names already taken by files of others next to a fresh one (the system
    // hands out numbers in order) are stepped over, and their files left as they were.
    DownloadTarget first;
    ASSERT_EQ(S_OK, DownloadTarget::Create(Folder(), first));
    const std::wstring stem = first.Path().substr(Folder().size() + 3);
    const unsigned number = static_cast<unsigned>(wcstoul(stem.c_str(), nullptr, 16));
    const bool upper = stem.find_first_of(L"ABCDEF") != std::wstring::npos;
    std::set<std::wstring> planted;
    for (unsigned next = number + 1; next <= number + 12; ++next) {
        wchar_t name[16];
        swprintf(name, 16, upper ? L"QRV%X" : L"QRV%x", next & 0xFFFF);
        planted.insert(name);
        std::ofstream(std::filesystem::path(Folder() + name), std::ios::binary)
            << std::string(name, name + wcslen(name));
    }
    DownloadTarget second;
    ASSERT_EQ(S_OK, DownloadTarget::Create(Folder(), second));
    const std::wstring secondName = second.Path().substr(Folder().size());
    EXPECT_EQ(0u, planted.count(secondName)) << "took " << secondName;
    second.Remove();
    first.Remove();
    const std::vector<std::wstring> names = FilesIn(records_);
    std::set<std::wstring> left(names.begin(), names.end());
    left.erase(L"QRVBEEF");
    EXPECT_EQ(planted, left) << "only the files of others are left, no reservation";
    for (const std::wstring& name : planted)
        EXPECT_EQ(std::string(name.begin(), name.end()), ContentOf(Folder() + name));
}

// GetTempFileNameW takes a folder of at most MAX_PATH - 14 characters; a longer one is refused
// with that reason before anything is made in it.
TEST_F(DownloadTargets, AFolderTooLongForTheSystemsTemporaryNamesIsRefusedWithItsReason) {
    const std::wstring longest =
        Folder() + std::wstring(MAX_PATH - 14 - Folder().size() - 1, L'd') + L"\\";
    const std::wstring tooLong =
        Folder() + std::wstring(MAX_PATH - 14 - Folder().size(), L'e') + L"\\";
    ASSERT_EQ(static_cast<size_t>(MAX_PATH - 14), longest.size());
    ASSERT_TRUE(::CreateDirectoryW(longest.c_str(), nullptr));
    ASSERT_TRUE(::CreateDirectoryW(tooLong.c_str(), nullptr));
    {
        DownloadTarget target;
        EXPECT_EQ(S_OK, DownloadTarget::Create(longest, target));
        EXPECT_TRUE(FileExists(target.Path()));
    }
    DownloadTarget target;
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_BUFFER_OVERFLOW), DownloadTarget::Create(tooLong, target));
    EXPECT_FALSE(target);
    EXPECT_TRUE(std::filesystem::is_empty(std::filesystem::path(tooLong)));
}
