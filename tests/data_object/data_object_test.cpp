// The data object through IDataObject and the OLE clipboard, over an isolated station store.
#include <windows.h>
#include <shlobj.h>

#include <gtest/gtest.h>

#include <cstring>
#include <utility>
#include <vector>

#include "tests/data_object/data_object_fixture.h"
#include "tools/lvconsume/portable/strict_id_list_array.h"

using Microsoft::WRL::ComPtr;

TEST_F(DataObject, QueryGetDataAnswersEachFormatOnlyWithItsTymed) {
    ComPtr<IDataObject> data = Over({kNorthFile});
    for (const wchar_t* name : {CFSTR_FILEDESCRIPTORW, CFSTR_SHELLIDLIST, kStationListFormatName,
                                CFSTR_PREFERREDDROPEFFECT}) {
        FORMATETC format = Request(name, TYMED_HGLOBAL);
        EXPECT_EQ(S_OK, data->QueryGetData(&format)) << name;
        format.tymed = TYMED_HGLOBAL | TYMED_ISTREAM;
        EXPECT_EQ(S_FALSE, data->QueryGetData(&format)) << name << ": exactly TYMED_HGLOBAL";
    }
    FORMATETC contents = Request(CFSTR_FILECONTENTS, TYMED_HGLOBAL | TYMED_ISTREAM, 0);
    EXPECT_EQ(S_OK, data->QueryGetData(&contents));
    contents.tymed = TYMED_HGLOBAL;
    EXPECT_EQ(S_FALSE, data->QueryGetData(&contents));
    FORMATETC text = {CF_UNICODETEXT, nullptr, DVASPECT_CONTENT, -1, TYMED_HGLOBAL};
    EXPECT_EQ(S_FALSE, data->QueryGetData(&text));
    UniqueStgMedium medium;
    EXPECT_EQ(E_INVALIDARG, data->GetData(&text, medium.put()));
}

TEST_F(DataObject, EnumerationListsFourFormatsButNotTheDropEffectWhichIsAlwaysCopy) {
    ComPtr<IDataObject> data = Over({kNorthFile});
    ComPtr<IEnumFORMATETC> formats;
    ASSERT_EQ(S_OK, data->EnumFormatEtc(DATADIR_SET, &formats));
    FORMATETC entries[10] = {};
    ULONG fetched = 0;
    ASSERT_EQ(S_OK, formats->Next(10, entries, &fetched));
    ASSERT_EQ(4u, fetched);
    const wchar_t* names[] = {CFSTR_FILECONTENTS, CFSTR_FILEDESCRIPTORW, CFSTR_SHELLIDLIST,
                              kStationListFormatName};
    for (ULONG i = 0; i < 4; ++i) {
        EXPECT_EQ(RegisteredClipboardFormat(names[i]), entries[i].cfFormat) << i;
        EXPECT_EQ(-1, entries[i].lindex);
        EXPECT_EQ(static_cast<DWORD>(i == 0 ? TYMED_ISTREAM : TYMED_HGLOBAL), entries[i].tymed);
    }
    EXPECT_EQ(S_FALSE, formats->Next(10, entries, &fetched));
    EXPECT_EQ(0u, fetched);

    // Skip, Reset and Clone keep their own positions.
    ASSERT_EQ(S_OK, formats->Reset());
    EXPECT_EQ(E_POINTER, formats->Next(2, entries, nullptr));
    EXPECT_EQ(S_OK, formats->Skip(2));
    EXPECT_EQ(S_FALSE, formats->Skip(2)) << "position + count at the end";
    ComPtr<IEnumFORMATETC> clone;
    ASSERT_EQ(S_OK, formats->Clone(&clone));
    ASSERT_EQ(S_OK, clone->Next(1, entries, nullptr));
    EXPECT_EQ(RegisteredFormat(ClipboardFormat::ShellIdList), entries[0].cfFormat);
    ASSERT_EQ(S_OK, formats->Next(1, entries, nullptr));
    EXPECT_EQ(RegisteredFormat(ClipboardFormat::ShellIdList), entries[0].cfFormat);

    UniqueStgMedium medium;
    ASSERT_EQ(S_OK, Get(data.Get(), CFSTR_PREFERREDDROPEFFECT, TYMED_HGLOBAL, medium));
    GlobalLockGuard lock(medium.get().hGlobal);
    EXPECT_EQ(static_cast<DWORD>(DROPEFFECT_COPY), *static_cast<DWORD*>(lock.data()));
}

TEST_F(DataObject, FileGroupDescriptorNamesFilesByModel) {
    ComPtr<IDataObject> data =
        Over({kNorthFile, kSouthFile,
              L"Quorvel Digital Level\\Deleted\\file1.hvr", L"Quorvel Digital Level"});
    UniqueStgMedium medium;
    ASSERT_EQ(S_OK, Get(data.Get(), CFSTR_FILEDESCRIPTORW, TYMED_HGLOBAL, medium));
    GlobalLockGuard lock(medium.get().hGlobal);
    ASSERT_GE(lock.size(), sizeof(UINT) + 4 * sizeof(FILEDESCRIPTORW));
    const auto* group = static_cast<const FILEGROUPDESCRIPTORW*>(lock.data());
    ASSERT_EQ(4u, group->cItems);
    EXPECT_STREQ(L"file1.lv", group->fgd[0].cFileName);
    EXPECT_STREQ(L"file1.hvr", group->fgd[1].cFileName);
    EXPECT_STREQ(L"file1.lv", group->fgd[2].cFileName) << "a station that cannot be loaded";
    EXPECT_STREQ(L"file1.lv", group->fgd[3].cFileName) << "a list without a station";
    EXPECT_EQ(0u, group->fgd[0].dwFlags) << "no size, time or attributes are announced";

    UniqueStgMedium none;
    EXPECT_EQ(S_FALSE, Get(Over({}).Get(), CFSTR_FILEDESCRIPTORW, TYMED_HGLOBAL, none));
}

TEST_F(DataObject, FileContentsRefusesBadIndexesAndItemsThatAreNotFiles) {
    ScriptedDialogs dialogs(IDOK);
    ScopedUserInterface scope(dialogs);
    ComPtr<IDataObject> data = Over(
        {kNorthFile, L"Quorvel Digital Level\\North", L"Quorvel Digital Level\\Gone\\file1.lv"});
    // Outside the list, a station rather than a file, and a station that cannot be loaded.
    const std::pair<LONG, HRESULT> cases[] = {
        {-1, S_FALSE}, {3, S_FALSE}, {1, S_FALSE}, {2, E_FAIL}};
    for (const auto& [index, expected] : cases) {
        UniqueStgMedium medium;
        EXPECT_EQ(expected, Get(data.Get(), CFSTR_FILECONTENTS, TYMED_ISTREAM, medium, index))
            << index;
    }
    EXPECT_EQ(0, dialogs.runs) << "no download was started";
}

namespace {

// Counts the releases that a medium's pUnkForRelease receives.
class ReleaseCounter final : public IUnknown {
public:
    IFACEMETHODIMP QueryInterface(REFIID, void** object) override {
        *object = nullptr;
        return E_NOINTERFACE;
    }
    IFACEMETHODIMP_(ULONG) AddRef() override { return 2; }
    IFACEMETHODIMP_(ULONG) Release() override { return static_cast<ULONG>(++releases); }
    int releases = 0;
};

}  // namespace

TEST_F(DataObject, SetDataReleasesTheMediumOnlyWhenItIsHandedOver) {
    ComPtr<IDataObject> data = Over({kNorthFile});
    for (const BOOL handedOver : {FALSE, TRUE}) {
        ReleaseCounter owner;
        UniqueHGlobal block(::GlobalAlloc(GMEM_MOVEABLE, sizeof(DWORD)));
        STGMEDIUM medium{};
        medium.tymed = TYMED_HGLOBAL;
        medium.hGlobal = block.get();
        medium.pUnkForRelease = &owner;  // releasing the medium releases this, not the block
        FORMATETC format = Request(L"Performed DropEffect", TYMED_HGLOBAL);
        EXPECT_EQ(S_OK, data->SetData(&format, &medium, handedOver));
        EXPECT_EQ(handedOver ? 1 : 0, owner.releases) << handedOver;
    }
}

// One to five stations: every child has its own offset inside the block, names its station, and
// the system's own reader of the format sees the same items below the folder's place in the
// shell (here My Computer stands in for it).
TEST_F(DataObject, ShellIdListArrayGivesEveryChildItsOwnOffsetInsideTheBlock) {
    const wchar_t* const names[] = {L"North", L"South", L"East", L"West", L"Centre"};
    UniqueAbsoluteIdList folder;
    ASSERT_EQ(S_OK, ::SHGetSpecialFolderLocation(
                        nullptr, CSIDL_DRIVES, folder.put()));
    const UINT folderSize = manager_.GetSize(folder.get());
    for (size_t count = 1; count <= 5; ++count) {
        SCOPED_TRACE(count);
        auto object = MakeComObject<CLVDataObject>(MakeDialogStationDownloader());
        ASSERT_EQ(S_OK, object->SetFolderLocation(folder.get()));
        for (size_t index = 0; index < count; ++index) {
            const std::wstring path = std::wstring(L"Quorvel Digital Level\\") + names[index];
            UniqueRelativePidl list = manager_.CreatePidlFromPath(path.c_str());
            ASSERT_EQ(S_OK, object->SetItem(list.get()));
        }
        UniqueStgMedium medium;
        ASSERT_EQ(S_OK, Get(object.Get(), CFSTR_SHELLIDLIST, TYMED_HGLOBAL, medium));
        // Every offset and every list must lie wholly inside the block, as a strict reader sees it.
        std::vector<std::vector<BYTE>> lists;
        {
            GlobalLockGuard lock(medium.get().hGlobal);
            const auto* bytes = static_cast<const BYTE*>(lock.data());
            const StrictIdListArray array = ReadIdListArrayStrictly(bytes, lock.size());
            EXPECT_TRUE(array.valid()) << array.fault;
            for (const IdListSpan& span : array.lists)
                lists.emplace_back(bytes + span.offset, bytes + span.offset + span.length);
        }
        ASSERT_EQ(count + 1, lists.size()) << "an offset or a list outside the block";
        ASSERT_EQ(folderSize, lists[0].size());
        EXPECT_EQ(0, memcmp(lists[0].data(), folder.get(), folderSize))
            << "the parent is the folder's place from the desktop";
        for (size_t index = 0; index < count; ++index) {
            const auto child = reinterpret_cast<PCUITEMID_CHILD>(lists[index + 1].data());
            EXPECT_EQ(1u, manager_.GetItemCount(child));
            EXPECT_EQ(names[index], manager_.GetItemName(child));
        }

        // The system's reader combines the parent with each child by the same offsets.
        ComPtr<IShellItemArray> items;
        ASSERT_EQ(S_OK, ::SHCreateShellItemArrayFromDataObject(object.Get(), IID_PPV_ARGS(&items)));
        DWORD itemCount = 0;
        ASSERT_EQ(S_OK, items->GetCount(&itemCount));
        ASSERT_EQ(count, itemCount);
        for (DWORD index = 0; index < itemCount; ++index) {
            ComPtr<IShellItem> item;
            ASSERT_EQ(S_OK, items->GetItemAt(index, &item));
            UniqueAbsoluteIdList full;
            ASSERT_EQ(S_OK, ::SHGetIDListFromObject(
                                item.Get(), reinterpret_cast<PIDLIST_ABSOLUTE*>(full.put())));
            ASSERT_EQ(manager_.GetItemCount(folder.get()) + 1, manager_.GetItemCount(full.get()));
            EXPECT_EQ(names[index], manager_.GetItemName(manager_.GetLastItem(full.get())));
        }
    }
    // Without a place the items' lists would be taken for the desktop's: the format is left out.
    UniqueStgMedium none;
    EXPECT_EQ(S_FALSE, Get(Over({L"Quorvel Digital Level\\North"}).Get(), CFSTR_SHELLIDLIST,
                           TYMED_HGLOBAL, none))
        << "no place";
    auto rootOnly = MakeComObject<CLVDataObject>(MakeDialogStationDownloader());
    UniqueRelativePidl root = manager_.CreatePidlFromPath(L"Quorvel Digital Level");
    ASSERT_EQ(S_OK, rootOnly->SetItem(root.get()));
    ASSERT_EQ(S_OK, rootOnly->SetFolderLocation(folder.get()));
    EXPECT_EQ(S_FALSE, Get(rootOnly.Get(), CFSTR_SHELLIDLIST, TYMED_HGLOBAL, none)) << "no parent";
}

TEST_F(DataObject, StationListOnTheOleClipboardCarriesTheLoadableStations) {
    ComPtr<IDataObject> data =
        Over({L"Quorvel Digital Level\\South", L"Quorvel Digital Level\\Gone", kNorthFile});
    ASSERT_EQ(S_OK, ::OleSetClipboard(data.Get()));
    data.Reset();
    ComPtr<IDataObject> pasted;
    ASSERT_EQ(S_OK, ::OleGetClipboard(&pasted));
    const std::vector<Station> stations = StationsIn(pasted.Get());
    pasted.Reset();
    ASSERT_EQ(S_OK, ::OleSetClipboard(nullptr));
    ASSERT_EQ(2u, stations.size());
    EXPECT_EQ(L"South", stations[0].Name);
    EXPECT_EQ(L"Quorvel LV-30", stations[0].Model);
    EXPECT_EQ(L"North", stations[1].Name);

    EXPECT_TRUE(StationsIn(Over({}).Get()).empty());
}

TEST_F(DataObject, DropSourceEndsOnButtonRelease) {
    auto object = MakeComObject<CLVDataObject>(MakeDialogStationDownloader());
    EXPECT_EQ(S_OK, object->QueryContinueDrag(FALSE, MK_LBUTTON));
    EXPECT_EQ(DRAGDROP_S_DROP, object->QueryContinueDrag(FALSE, 0));
    EXPECT_EQ(DRAGDROP_S_CANCEL, object->QueryContinueDrag(TRUE, MK_LBUTTON));
}

// What the object does not support still leaves its out-parameters as COM asks of a failure: a
// caller that frees what it got back frees nothing of ours, and no garbage of its own.
TEST_F(DataObject, UnsupportedOperationsHandBackNullOutParameters) {
    ComPtr<IDataObject> data = Over({kNorthFile});
    auto* const poison = reinterpret_cast<IEnumSTATDATA*>(static_cast<uintptr_t>(0xBAADF00D));
    IEnumSTATDATA* advises = poison;
    EXPECT_EQ(E_NOTIMPL, data->EnumDAdvise(&advises));
    EXPECT_EQ(nullptr, advises);
    EXPECT_EQ(E_NOTIMPL, data->EnumDAdvise(nullptr));

    // A request for a device: its target device must not come back as the canonical one's, which
    // the caller would free a second time.
    auto* device = static_cast<DVTARGETDEVICE*>(::CoTaskMemAlloc(sizeof(DVTARGETDEVICE)));
    ASSERT_NE(nullptr, device);
    *device = {};
    device->tdSize = sizeof(DVTARGETDEVICE);
    FORMATETC requests[] = {
        {RegisteredFormat(ClipboardFormat::FileContents), nullptr, DVASPECT_CONTENT, 0,
         TYMED_ISTREAM},
        {RegisteredFormat(ClipboardFormat::ShellIdList), device, DVASPECT_CONTENT, -1,
         TYMED_HGLOBAL},
    };
    for (FORMATETC& request : requests) {
        FORMATETC canonical;
        memset(&canonical, 0xCD, sizeof canonical);
        EXPECT_EQ(E_NOTIMPL, data->GetCanonicalFormatEtc(&request, &canonical));
        EXPECT_EQ(nullptr, canonical.ptd);
        EXPECT_EQ(request.cfFormat, canonical.cfFormat);
        EXPECT_EQ(request.lindex, canonical.lindex);
        EXPECT_EQ(request.tymed, canonical.tymed);
    }
    ::CoTaskMemFree(device);
    FORMATETC canonical;
    memset(&canonical, 0xCD, sizeof canonical);
    EXPECT_EQ(E_NOTIMPL, data->GetCanonicalFormatEtc(nullptr, &canonical));
    EXPECT_EQ(nullptr, canonical.ptd);
    EXPECT_EQ(E_NOTIMPL, data->GetCanonicalFormatEtc(requests, nullptr));
}
