// The folder's answers about items: display names by flags, attributes, comparison.
#include "tests/shell_folder/shell_folder_fixture.h"
#include "tests/support/allocation_failure.h"

#include <cstring>

TEST_F(ShellFolderTest, DisplayNameFlagRules) {
    UniqueChildPidl station = StationItem(L"Station 1");
    const std::wstring full = std::wstring(kPrefix) + L"\\Station 1";
    const struct {
        SHGDNF flags;
        HRESULT result;
        std::wstring name;
    } cases[] = {
        {SHGDN_NORMAL, S_OK, L"Station 1"},
        {SHGDN_FORADDRESSBAR | SHGDN_INFOLDER, S_OK, L"Station 1"},
        {SHGDN_FORPARSING, S_OK, full},
        {SHGDN_FORPARSING | SHGDN_INFOLDER, S_OK, L"Station 1"},
        {SHGDN_FORPARSING | 2, S_OK, L""},
        {SHGDN_FORPARSING | SHGDN_FORADDRESSBAR, E_INVALIDARG, L"(none)"},
        {SHGDN_FOREDITING, E_INVALIDARG, L"(none)"},
        {SHGDN_FOREDITING | SHGDN_FORPARSING, E_INVALIDARG, L"(none)"},
        {2, E_INVALIDARG, L"(none)"},
        {SHGDN_FORADDRESSBAR | 2, E_INVALIDARG, L"(none)"},
    };
    for (const auto& test : cases) {
        std::wstring name = L"(none)";
        EXPECT_EQ(test.result, DisplayName(root_.Get(), station, test.flags, name))
            << "flags 0x" << std::hex << test.flags;
        EXPECT_EQ(test.name, name) << "flags 0x" << std::hex << test.flags;
    }
}

TEST_F(ShellFolderTest, DisplayNamesOfLongNamesStayWithinThePathLength) {
    // A station whose name is near the registry's limit: its folder path no longer fits.
    UniqueChildPidl station = StationItem(std::wstring(255, L'L'));
    std::wstring name;
    ASSERT_EQ(S_OK, DisplayName(root_.Get(), station, SHGDN_FORPARSING, name));
    EXPECT_LT(name.size(), 260u);
    EXPECT_EQ(0u, name.find(kPrefix));

    ComPtr<IShellFolder> stationFolder = Bind(root_.Get(), station);
    ASSERT_TRUE(stationFolder);
    ASSERT_EQ(S_OK,
              DisplayName(stationFolder.Get(), FileItem(L"file1.lv"), SHGDN_FORPARSING, name));
    EXPECT_LT(name.size(), 260u);
    // Parsing in a folder whose own path does not fit fails instead of naming something else.
    UniqueRelativePidl parsed;
    EXPECT_EQ(E_INVALIDARG, Parse(stationFolder.Get(), L"file1.lv", parsed));
    // Nor does it list the root's stations as its own items.
    AddStationOfModel(L"Station 1");
    EXPECT_EQ(Items{}, Enumerate(stationFolder.Get(), SHCONTF_FOLDERS | SHCONTF_NONFOLDERS));
}

TEST_F(ShellFolderTest, AttributesByKindAndValidationWhichFailsAsAResult) {
    AddStationOfModel(L"Station 1");
    UniqueChildPidl station = StationItem(L"Station 1");
    UniqueChildPidl deleted = StationItem(L"Gone");
    UniqueChildPidl file = FileItem(L"file1.lv");
    UniqueChildPidl root = manager_.CreateRootPidl();
    const SFGAOF stationBits = 0x20000100;
    const struct {
        const char* rule;
        std::vector<PCUITEMID_CHILD> items;
        SFGAOF requested;
        HRESULT result;
        SFGAOF attributes;  // when the call succeeds
    } cases[] = {
        {"no items", {}, 0, S_OK, 0xFFFFFFFF},
        {"the request does not limit", {station.get()}, SFGAO_CANCOPY, S_OK, stationBits},
        {"a file", {file.get()}, 0, S_OK, SFGAO_CANCOPY},
        {"the root item", {root.get()}, 0, S_OK, 0},
        {"stations and files share none", {station.get(), file.get()}, 0, S_OK, 0},
        // A deleted station fails only when asked to validate, and only as first item.
        {"stored, validated", {station.get()}, SFGAO_VALIDATE, S_OK, stationBits},
        {"deleted, validated", {deleted.get()}, SFGAO_VALIDATE | SFGAO_FOLDER, E_FAIL, 0},
        {"deleted, not validated", {deleted.get()}, SFGAO_FOLDER, S_OK, stationBits},
        {"deleted second", {station.get(), deleted.get()}, SFGAO_VALIDATE, S_OK, stationBits},
    };
    auto attributes = [&](std::vector<PCUITEMID_CHILD> items, SFGAOF& result) {
        return root_->GetAttributesOf(static_cast<UINT>(items.size()), items.data(), &result);
    };
    for (const auto& test : cases) {
        SFGAOF result = test.requested;
        EXPECT_EQ(test.result, attributes(test.items, result)) << test.rule;
        if (SUCCEEDED(test.result)) {
            EXPECT_EQ(test.attributes, result) << test.rule;
        }
    }

    // The validation reads the store, which allocates: a failure there is a result, not a throw.
    PCUITEMID_CHILD item = station.get();
    SFGAOF result = SFGAO_VALIDATE;
    HRESULT failed = S_OK;
    {
        ScopedAllocationFailure failing;
        failed = root_->GetAttributesOf(1, &item, &result);
    }
    EXPECT_EQ(E_OUTOFMEMORY, failed);

    ASSERT_EQ(S_OK, DeleteStation(Named(L"Station 1")));
    result = SFGAO_VALIDATE;
    EXPECT_EQ(E_FAIL, attributes({station.get()}, result));
}

TEST_F(ShellFolderTest, MalformedItemsAreRefusedBeforeTheirNamesAreRead) {
    // A station item whose name runs to the end of its cb without a terminator.
    UniqueChildPidl unterminated = StationItem(L"AB");
    memset(reinterpret_cast<uint8_t*>(unterminated.get()) + kItemNameOffset, 'x',
           unterminated.get()->mkid.cb - kItemNameOffset);
    // An item too short to hold a kind and a name, followed by the list terminator.
    uint8_t tiny[] = {4, 0, 2, 0, 0, 0};
    UniqueChildPidl unknownKind = StationItem(L"K");
    reinterpret_cast<uint8_t*>(unknownKind.get())[kItemKindOffset] = 9;
    UniqueChildPidl good = StationItem(L"S");

    const PCUITEMID_CHILD malformed[] = {
        unterminated.get(), reinterpret_cast<PCUITEMID_CHILD>(tiny), unknownKind.get()};
    for (PCUITEMID_CHILD item : malformed) {
        STRRET text{};
        EXPECT_EQ(E_INVALIDARG, root_->GetDisplayNameOf(item, SHGDN_NORMAL, &text));
        SFGAOF attributes = SFGAO_VALIDATE;
        EXPECT_EQ(E_INVALIDARG, root_->GetAttributesOf(1, &item, &attributes));
        EXPECT_EQ(E_INVALIDARG, root_->CompareIDs(0, good.get(), item));
        void* object = reinterpret_cast<void*>(1);
        EXPECT_EQ(E_INVALIDARG,
                  root_->GetUIObjectOf(nullptr, 1, &item, IID_IQueryInfo, nullptr, &object));
        EXPECT_EQ(nullptr, object);
        object = reinterpret_cast<void*>(1);
        EXPECT_EQ(E_INVALIDARG, root_->BindToObject(item, nullptr, IID_IShellFolder, &object));
        EXPECT_EQ(nullptr, object);
    }
}

TEST_F(ShellFolderTest, CompareIDsReturnsTheSignedOrderUnfolded) {
    UniqueChildPidl alpha = StationItem(L"alpha");
    UniqueChildPidl beta = StationItem(L"Beta");
    UniqueChildPidl alphaUpper = StationItem(L"ALPHA");
    UniqueChildPidl file = FileItem(L"zzz");
    auto compare = [&](LPARAM column, const UniqueChildPidl& first, const UniqueChildPidl& second) {
        return root_->CompareIDs(column, first.get(), second.get());
    };
    const HRESULT order = compare(0, alpha, beta);
    EXPECT_LT(order, 0) << "case is ignored: alpha before Beta";
    EXPECT_GT(compare(0, beta, alpha), 0);
    EXPECT_EQ(0, compare(0, alpha, alphaUpper));
    EXPECT_EQ(-3 * order, compare(-3, alpha, beta)) << "a column other than 0 scales the order";
    EXPECT_EQ(order, compare(static_cast<LPARAM>(0x700000000LL), alpha, beta))
        << "only the low 32 bits of the column count";
    EXPECT_EQ(0, compare(0, alpha, file)) << "items of different kinds compare equal";
}
