// The folder's answers about items: display names by flags, attributes, comparison.
#include "tests/shell_folder/shell_folder_fixture.h"
#include "tests/support/allocation_failure.h"

#include <cstdint>
#include <cstring>

TEST_F(ShellFolderTest, DisplayNameFlagRules) {
    ComPtr<IShellFolder> folder = CreateRootFolder();
    UniquePidl station = StationItem(L"Station 1");
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
        EXPECT_EQ(test.result, DisplayName(folder.Get(), station, test.flags, name))
            << "flags 0x" << std::hex << test.flags;
        EXPECT_EQ(test.name, name) << "flags 0x" << std::hex << test.flags;
    }
}

TEST_F(ShellFolderTest, DisplayNamesOfLongNamesStayWithinThePathLength) {
    // A station whose name is near the registry's limit: its folder path no longer fits.
    ComPtr<IShellFolder> root = CreateRootFolder();
    UniquePidl station = StationItem(std::wstring(255, L'L'));
    std::wstring name;
    ASSERT_EQ(S_OK, DisplayName(root.Get(), station, SHGDN_FORPARSING, name));
    EXPECT_LT(name.size(), 260u);
    EXPECT_EQ(0u, name.find(kPrefix));

    ComPtr<IShellFolder> stationFolder = Bind(root.Get(), station);
    ASSERT_TRUE(stationFolder);
    ASSERT_EQ(S_OK,
              DisplayName(stationFolder.Get(), FileItem(L"file1.lv"), SHGDN_FORPARSING, name));
    EXPECT_LT(name.size(), 260u);
    // Parsing in a folder whose own path does not fit fails instead of naming something else.
    UniquePidl parsed;
    EXPECT_EQ(E_INVALIDARG, Parse(stationFolder.Get(), L"file1.lv", parsed));
    // Nor does it list the root's stations as its own items.
    AddStationOfModel(L"Station 1");
    EXPECT_EQ(Items{}, Enumerate(stationFolder.Get(), SHCONTF_FOLDERS | SHCONTF_NONFOLDERS));
}

TEST_F(ShellFolderTest, AttributesByKindAndValidation) {
    AddStationOfModel(L"Station 1");
    ComPtr<IShellFolder> folder = CreateRootFolder();
    UniquePidl station = StationItem(L"Station 1");
    UniquePidl deleted = StationItem(L"Gone");
    UniquePidl file = FileItem(L"file1.lv");
    UniquePidl root(manager_.CreateRootPidl());
    SFGAOF result = 0;
    auto attributes = [&](std::vector<PCUITEMID_CHILD> items, SFGAOF requested) {
        result = requested;
        return folder->GetAttributesOf(static_cast<UINT>(items.size()), items.data(), &result);
    };

    EXPECT_EQ(S_OK, attributes({}, 0));
    EXPECT_EQ(0xFFFFFFFFu, result);
    EXPECT_EQ(S_OK, attributes({Child(station)}, SFGAO_CANCOPY));
    EXPECT_EQ(0x20000100u, result) << "the request does not limit the result";
    EXPECT_EQ(S_OK, attributes({Child(file)}, 0));
    EXPECT_EQ(static_cast<SFGAOF>(SFGAO_CANCOPY), result);
    EXPECT_EQ(S_OK, attributes({Child(root)}, 0));
    EXPECT_EQ(0u, result);
    EXPECT_EQ(S_OK, attributes({Child(station), Child(file)}, 0));
    EXPECT_EQ(0u, result) << "stations and files share no attribute";

    // Validation: a deleted station fails only when asked to validate, and only as first item.
    EXPECT_EQ(S_OK, attributes({Child(station)}, SFGAO_VALIDATE));
    EXPECT_EQ(0x20000100u, result);
    EXPECT_EQ(E_FAIL, attributes({Child(deleted)}, SFGAO_VALIDATE | SFGAO_FOLDER));
    EXPECT_EQ(S_OK, attributes({Child(deleted)}, SFGAO_FOLDER));
    EXPECT_EQ(0x20000100u, result);
    EXPECT_EQ(S_OK, attributes({Child(station), Child(deleted)}, SFGAO_VALIDATE));
    EXPECT_EQ(0x20000100u, result);

    ASSERT_EQ(S_OK, DeleteStation(Named(L"Station 1")));
    EXPECT_EQ(E_FAIL, attributes({Child(station)}, SFGAO_VALIDATE));
}

TEST_F(ShellFolderTest, AllocationFailureWhileValidatingIsAResultNotAnException) {
    AddStationOfModel(L"Station 1");
    ComPtr<IShellFolder> folder = CreateRootFolder();
    UniquePidl station = StationItem(L"Station 1");
    PCUITEMID_CHILD item = Child(station);
    SFGAOF attributes = SFGAO_VALIDATE;
    HRESULT result = S_OK;
    {
        // The validation reads the store, which allocates.
        ScopedAllocationFailure failing;
        result = folder->GetAttributesOf(1, &item, &attributes);
    }
    EXPECT_EQ(E_OUTOFMEMORY, result);
}

TEST_F(ShellFolderTest, MalformedItemsAreRefusedBeforeTheirNamesAreRead) {
    ComPtr<IShellFolder> folder = CreateRootFolder();
    // A station item whose name runs to the end of its cb without a terminator.
    UniquePidl unterminated = StationItem(L"AB");
    memset(reinterpret_cast<uint8_t*>(unterminated.get()) + kItemNameOffset, 'x',
           unterminated.get()->mkid.cb - kItemNameOffset);
    // An item too short to hold a kind and a name, followed by the list terminator.
    uint8_t tiny[] = {4, 0, 2, 0, 0, 0};
    UniquePidl unknownKind = StationItem(L"K");
    reinterpret_cast<uint8_t*>(unknownKind.get())[kItemKindOffset] = 9;
    UniquePidl good = StationItem(L"S");

    for (LPITEMIDLIST bad :
         {unterminated.get(), reinterpret_cast<LPITEMIDLIST>(tiny), unknownKind.get()}) {
        PCUITEMID_CHILD item = reinterpret_cast<PCUITEMID_CHILD>(bad);
        STRRET text{};
        EXPECT_EQ(E_INVALIDARG, folder->GetDisplayNameOf(item, SHGDN_NORMAL, &text));
        SFGAOF attributes = SFGAO_VALIDATE;
        EXPECT_EQ(E_INVALIDARG, folder->GetAttributesOf(1, &item, &attributes));
        EXPECT_EQ(E_INVALIDARG, folder->CompareIDs(0, Child(good), item));
        void* object = reinterpret_cast<void*>(1);
        EXPECT_EQ(E_INVALIDARG,
                  folder->GetUIObjectOf(nullptr, 1, &item, IID_IQueryInfo, nullptr, &object));
        EXPECT_EQ(nullptr, object);
        object = reinterpret_cast<void*>(1);
        EXPECT_EQ(E_INVALIDARG, folder->BindToObject(item, nullptr, IID_IShellFolder, &object));
        EXPECT_EQ(nullptr, object);
    }
}

TEST_F(ShellFolderTest, CompareIDsReturnsTheSignedOrderUnfolded) {
    ComPtr<IShellFolder> folder = CreateRootFolder();
    UniquePidl alpha = StationItem(L"alpha");
    UniquePidl beta = StationItem(L"Beta");
    UniquePidl alphaUpper = StationItem(L"ALPHA");
    UniquePidl file = FileItem(L"zzz");
    auto compare = [&](LPARAM column, const UniquePidl& first, const UniquePidl& second) {
        return folder->CompareIDs(column, Child(first), Child(second));
    };
    const HRESULT order = compare(0, alpha, beta);
    EXPECT_LT(order, 0) << "case is ignored: alpha before Beta";
    EXPECT_GT(compare(0, beta, alpha), 0);
    EXPECT_EQ(0, compare(0, alpha, alphaUpper));
    EXPECT_EQ(-3 * order, compare(-3, alpha, beta)) << "a column other than 0 scales the order";
    EXPECT_EQ(order, compare(static_cast<LPARAM>(0x700000000LL), alpha, beta))
        << "only the low 32 bits of the column count";
    EXPECT_EQ(0, compare(0, alpha, file)) << "items of different kinds compare equal";
    // The shell's SHCIDS bits arrive in the column too; the product wraps instead of overflowing.
    EXPECT_EQ(static_cast<HRESULT>(static_cast<uint32_t>(order) * 0x10000000u),
              compare(SHCIDS_CANONICALONLY, alpha, beta));
    EXPECT_EQ(static_cast<HRESULT>(static_cast<uint32_t>(order) * 0x80000000u),
              compare(static_cast<LPARAM>(SHCIDS_ALLFIELDS), alpha, beta));
}
