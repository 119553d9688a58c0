// The folder's answers about items: display names by flags, attributes, comparison.
#include "tests/shell_folder/shell_folder_fixture.h"
#include "tests/support/allocation_failure.h"

#include <cstdint>
#include <cstring>

TEST_F(ShellFolderTest, DisplayNameFlagRules) {
    ComPtr<IShellFolder> folder = CreateRootFolder();
    UniquePidl station = StationItem(L"Station 1");
    struct Case {
        SHGDNF flags;
        HRESULT result;
        std::wstring name;
    };
    const std::wstring full = std::wstring(kPrefix) + L"\\Station 1";
    const Case cases[] = {
        {SHGDN_NORMAL, S_OK, L"Station 1"},
        {SHGDN_FORADDRESSBAR | SHGDN_INFOLDER, S_OK, L"Station 1"},
        {SHGDN_FORPARSING, S_OK, full},
        {SHGDN_FORPARSING | SHGDN_INFOLDER, S_OK, L"Station 1"},
        {SHGDN_FORPARSING | 2, S_OK, L""},
        {SHGDN_FORPARSING | SHGDN_FORADDRESSBAR, E_INVALIDARG, L""},
        {SHGDN_FOREDITING | SHGDN_FORPARSING, E_INVALIDARG, L""},
        {2, E_INVALIDARG, L""},
        {SHGDN_FORADDRESSBAR | 2, E_INVALIDARG, L""},
    };
    for (const Case& test : cases) {
        std::wstring name = L"(none)";
        EXPECT_EQ(test.result, DisplayName(folder.Get(), station, test.flags, name))
            << "flags 0x" << std::hex << test.flags;
        if (test.result == S_OK) {
            EXPECT_EQ(test.name, name) << "flags 0x" << std::hex << test.flags;
        }
    }
}

TEST_F(ShellFolderTest, DisplayNamesOfLongNamesStayWithinThePathLength) {
    // A station whose name is near the registry's limit: its folder path no longer fits.
    const std::wstring longName(255, L'L');
    ComPtr<IShellFolder> root = CreateRootFolder();
    UniquePidl station = StationItem(longName);
    std::wstring name;
    ASSERT_EQ(S_OK, DisplayName(root.Get(), station, SHGDN_FORPARSING, name));
    EXPECT_LT(name.size(), 260u);
    EXPECT_EQ(0u, name.find(kPrefix));

    ComPtr<IShellFolder> stationFolder;
    ASSERT_EQ(S_OK, root->BindToObject(reinterpret_cast<PCUIDLIST_RELATIVE>(station.get()), nullptr,
                                       IID_PPV_ARGS(&stationFolder)));
    UniquePidl file = FileItem(L"file1.lv");
    ASSERT_EQ(S_OK, DisplayName(stationFolder.Get(), file, SHGDN_FORPARSING, name));
    EXPECT_LT(name.size(), 260u);
    // Parsing in a folder whose own path does not fit fails instead of naming something else.
    std::wstring fileName = L"file1.lv";
    PIDLIST_RELATIVE parsed = nullptr;
    EXPECT_EQ(E_INVALIDARG, stationFolder->ParseDisplayName(nullptr, nullptr, fileName.data(),
                                                            nullptr, &parsed, nullptr));
    EXPECT_EQ(nullptr, parsed);
    // Nor does it list the root's stations as its own items.
    AddStationOfModel(L"Station 1");
    EXPECT_TRUE(Enumerate(stationFolder.Get(), SHCONTF_FOLDERS | SHCONTF_NONFOLDERS).empty());
}

TEST_F(ShellFolderTest, AttributesByKindAndValidation) {
    AddStationOfModel(L"Station 1");
    ComPtr<IShellFolder> folder = CreateRootFolder();
    UniquePidl station = StationItem(L"Station 1");
    UniquePidl deleted = StationItem(L"Gone");
    UniquePidl file = FileItem(L"file1.lv");
    UniquePidl root = RootItem();

    auto attributes = [&](std::initializer_list<const UniquePidl*> items, SFGAOF requested,
                          SFGAOF& result) {
        std::vector<PCUITEMID_CHILD> array;
        for (const UniquePidl* item : items)
            array.push_back(Child(*item));
        result = requested;
        return folder->GetAttributesOf(static_cast<UINT>(array.size()), array.data(), &result);
    };

    SFGAOF result = 0;
    EXPECT_EQ(S_OK, attributes({}, 0, result));
    EXPECT_EQ(0xFFFFFFFFu, result);
    EXPECT_EQ(S_OK, attributes({&station}, SFGAO_CANCOPY, result));
    EXPECT_EQ(0x20000100u, result) << "the request does not limit the result";
    EXPECT_EQ(S_OK, attributes({&file}, 0, result));
    EXPECT_EQ(static_cast<SFGAOF>(SFGAO_CANCOPY), result);
    EXPECT_EQ(S_OK, attributes({&root}, 0, result));
    EXPECT_EQ(0u, result);
    EXPECT_EQ(S_OK, attributes({&station, &file}, 0, result));
    EXPECT_EQ(0u, result) << "stations and files share no attribute";

    // Validation: a deleted station fails only when asked to validate, and only as first item.
    EXPECT_EQ(S_OK, attributes({&station}, SFGAO_VALIDATE, result));
    EXPECT_EQ(0x20000100u, result);
    EXPECT_EQ(E_FAIL, attributes({&deleted}, SFGAO_VALIDATE | SFGAO_FOLDER, result));
    EXPECT_EQ(S_OK, attributes({&deleted}, SFGAO_FOLDER, result));
    EXPECT_EQ(0x20000100u, result);
    EXPECT_EQ(S_OK, attributes({&station, &deleted}, SFGAO_VALIDATE, result));
    EXPECT_EQ(0x20000100u, result);

    Station gone;
    gone.Name = L"Station 1";
    ASSERT_EQ(S_OK, DeleteStation(gone));
    EXPECT_EQ(E_FAIL, attributes({&station}, SFGAO_VALIDATE, result));
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
    UniquePidl unterminated = StationItem(L"AB");
    auto* bytes = reinterpret_cast<uint8_t*>(unterminated.get());
    memset(bytes + kItemNameOffset, 'x', unterminated.get()->mkid.cb - kItemNameOffset);
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
        void* object = reinterpret_cast<void*>(1);
        EXPECT_EQ(E_INVALIDARG,
                  folder->GetUIObjectOf(nullptr, 1, &item, IID_IQueryInfo, nullptr, &object));
        EXPECT_EQ(nullptr, object);
        EXPECT_EQ(E_INVALIDARG,
                  folder->CompareIDs(0, reinterpret_cast<PCUIDLIST_RELATIVE>(good.get()), item));
    }
}

TEST_F(ShellFolderTest, CompareIDsReturnsTheSignedOrderUnfolded) {
    ComPtr<IShellFolder> folder = CreateRootFolder();
    UniquePidl alpha = StationItem(L"alpha");
    UniquePidl beta = StationItem(L"Beta");
    UniquePidl alphaUpper = StationItem(L"ALPHA");
    UniquePidl file = FileItem(L"zzz");
    auto compare = [&](LPARAM column, const UniquePidl& first, const UniquePidl& second) {
        return folder->CompareIDs(column, reinterpret_cast<PCUIDLIST_RELATIVE>(first.get()),
                                  reinterpret_cast<PCUIDLIST_RELATIVE>(second.get()));
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
