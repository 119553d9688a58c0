// CPidlMgr: creation from paths, kind tests, copies and joins, the parsing prefix and validity.
// The item bytes, paths (cut ones included) and comparison scaling themselves are proved natively
// by the portable item-layout tests; comparison through CompareIDs and the refusal of malformed
// lists by the shell folder tests; counting and copying from an index through ParseDisplayName,
// and a list's last item and parent through the data object's "Shell IDList Array".
#include <windows.h>
#include <shlobj.h>

#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "namespace/pidl_manager.h"
#include "tests/stations/station_builders.h"
#include "tests/support/registry_override.h"

namespace {

class PidlManager : public ::testing::Test {
protected:
    UniqueRelativePidl Path(const wchar_t* path) {
        return manager_.CreatePidlFromPath(path);
    }

    std::vector<DWORD> KindsOf(PCUIDLIST_RELATIVE list) {
        std::vector<DWORD> kinds;
        for (PCUIDLIST_RELATIVE item = list; item && item->mkid.cb;
             item = manager_.GetNextItem(item))
            kinds.push_back(ItemKind(reinterpret_cast<const uint8_t*>(item)));
        return kinds;
    }

    CPidlMgr manager_;
};

using Kinds = std::vector<DWORD>;

}  // namespace

TEST_F(PidlManager, CopiesAndJoinsCarryTheSlackBytes) {
    UniqueChildPidl item = manager_.CreateItemPidl(L"Quorvel Digital Level\\A");
    ASSERT_TRUE(item);
    EXPECT_EQ(25u, manager_.GetSize(item.get()));
    // Copies and joins step by cb, so the five slack bytes travel along.
    UniqueChildPidl root = manager_.CreateRootPidl();
    UniqueRelativePidl joined = manager_.ConcatPidls(root.get(), item.get());
    EXPECT_EQ(root.get()->mkid.cb + 23u + 2u, manager_.GetSize(joined.get()));
    UniqueRelativePidl copy = manager_.CopyPidl(joined.get());
    ASSERT_EQ(manager_.GetSize(joined.get()), manager_.GetSize(copy.get()));
    EXPECT_EQ(0, memcmp(joined.get(), copy.get(), manager_.GetSize(copy.get())));
}

TEST_F(PidlManager, CreationFromPathsAndKindTestsOfTheLastItem) {
    UniqueRelativePidl full = Path(L"Quorvel Digital Level\\S1\\file1.lv");
    UniqueRelativePidl station = Path(L"Quorvel Digital Level\\S1");
    UniqueRelativePidl root = Path(L"Quorvel Digital Level");
    EXPECT_EQ((Kinds{PT_ROOT, PT_STATION, PT_FILE}), KindsOf(full.get()));
    EXPECT_EQ((Kinds{PT_ROOT}), KindsOf(root.get()));
    EXPECT_EQ((Kinds{PT_ROOT, PT_STATION, PT_FILE}), KindsOf(Path(L"\\A\\\\B\\C\\D\\E").get()))
        << "empty components are skipped and a fourth is ignored";
    for (const wchar_t* nothing : {L"", L"\\\\", static_cast<const wchar_t*>(nullptr)})
        EXPECT_FALSE(Path(nothing));

    UniqueChildPidl stationItem = manager_.CreateItemPidl(L"Quorvel Digital Level\\S1\\file1.lv");
    EXPECT_EQ((Kinds{PT_STATION}), KindsOf(stationItem.get()));
    UniqueChildPidl rootItem = manager_.CreateItemPidl(L"\\Quorvel Digital Level");
    EXPECT_EQ((Kinds{PT_ROOT}), KindsOf(rootItem.get()));
    EXPECT_EQ(L"Quorvel Digital Level", manager_.GetItemName(rootItem.get()));

    EXPECT_TRUE(manager_.IsFile(full.get()));
    EXPECT_FALSE(manager_.IsFolder(full.get()));
    EXPECT_TRUE(manager_.IsFolder(station.get()));
    EXPECT_FALSE(manager_.IsRoot(station.get()));
    EXPECT_TRUE(manager_.IsRoot(root.get()));
    EXPECT_TRUE(manager_.IsFolder(root.get()));
    EXPECT_FALSE(manager_.IsFile(PCUIDLIST_RELATIVE{}));
}

TEST_F(PidlManager, ParsingPrefixIsCopiedWithoutTerminatorWhenCut) {
    EXPECT_EQ(41u, manager_.GetParsingPrefix(nullptr, 0));
    wchar_t buffer[64];
    wmemset(buffer, L'#', 64);
    EXPECT_EQ(10u, manager_.GetParsingPrefix(buffer, 10));
    EXPECT_EQ(0, wmemcmp(L"::{7D3F2A6#", buffer, 11));
    EXPECT_EQ(41u, manager_.GetParsingPrefix(buffer, 64));
    EXPECT_STREQ(L"::{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}", buffer);
}

TEST_F(PidlManager, ValidityFollowsTheStore) {
    RegistryOverride registry;
    AddStationOfModel(L"Station 1");
    UniqueChildPidl station = manager_.CreateItemPidl(L"Quorvel Digital Level\\Station 1");
    UniqueChildPidl otherCase = manager_.CreateItemPidl(L"Quorvel Digital Level\\station 1");
    UniqueRelativePidl file = Path(L"Quorvel Digital Level\\Gone\\file1.lv");
    UniqueRelativePidl fileItem = manager_.CopyFromIndex(file.get(), 2);
    EXPECT_TRUE(manager_.IsValid(station.get()));
    EXPECT_FALSE(manager_.IsValid(otherCase.get())) << "the store compares names case-sensitively";
    EXPECT_TRUE(manager_.IsValid(fileItem.get()));
    EXPECT_TRUE(manager_.IsValid(file.get())) << "only the first item is looked at";

    ASSERT_EQ(S_OK, DeleteStation(Named(L"Station 1")));
    EXPECT_FALSE(manager_.IsValid(station.get()));
}
