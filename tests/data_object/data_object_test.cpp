// The data object through IDataObject and the OLE clipboard, over an isolated station store.
#include <windows.h>
#include <shlobj.h>

#include <gtest/gtest.h>

#include "tests/data_object/data_object_fixture.h"

using Microsoft::WRL::ComPtr;

TEST_F(DataObject, QueryGetDataAnswersEachFormatOnlyWithItsTymed) {
    ComPtr<IDataObject> data = Over({L"Quorvel Digital Level\\North\\file1.lv"});
    for (const wchar_t* name : {CFSTR_FILEDESCRIPTORW, CFSTR_SHELLIDLIST, L"Quorvel Total Stations",
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
    STGMEDIUM medium{};
    EXPECT_EQ(E_INVALIDARG, data->GetData(&text, &medium));
}

TEST_F(DataObject, EnumerationListsFourFormatsButNotTheDropEffectWhichIsAlwaysCopy) {
    ComPtr<IDataObject> data = Over({L"Quorvel Digital Level\\North\\file1.lv"});
    ComPtr<IEnumFORMATETC> formats;
    ASSERT_EQ(S_OK, data->EnumFormatEtc(DATADIR_SET, &formats));
    FORMATETC entries[10] = {};
    ULONG fetched = 0;
    ASSERT_EQ(S_OK, formats->Next(10, entries, &fetched));
    ASSERT_EQ(4u, fetched);
    const wchar_t* names[] = {CFSTR_FILECONTENTS, CFSTR_FILEDESCRIPTORW, CFSTR_SHELLIDLIST,
                              L"Quorvel Total Stations"};
    for (ULONG i = 0; i < 4; ++i) {
        EXPECT_EQ(Format(names[i]), entries[i].cfFormat) << i;
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
    EXPECT_EQ(Format(CFSTR_SHELLIDLIST), entries[0].cfFormat);
    ASSERT_EQ(S_OK, formats->Next(1, entries, nullptr));
    EXPECT_EQ(Format(CFSTR_SHELLIDLIST), entries[0].cfFormat);

    FORMATETC effect = Request(CFSTR_PREFERREDDROPEFFECT, TYMED_HGLOBAL);
    UniqueStgMedium medium;
    ASSERT_EQ(S_OK, data->GetData(&effect, medium.put()));
    GlobalLockGuard lock(medium.get().hGlobal);
    EXPECT_EQ(static_cast<DWORD>(DROPEFFECT_COPY), *static_cast<DWORD*>(lock.data()));
}

TEST_F(DataObject, FileGroupDescriptorNamesFilesByModel) {
    ComPtr<IDataObject> data =
        Over({L"Quorvel Digital Level\\North\\file1.lv", L"Quorvel Digital Level\\South\\file1.hvr",
              L"Quorvel Digital Level\\Deleted\\file1.hvr", L"Quorvel Digital Level"});
    FORMATETC format = Request(CFSTR_FILEDESCRIPTORW, TYMED_HGLOBAL);
    UniqueStgMedium medium;
    ASSERT_EQ(S_OK, data->GetData(&format, medium.put()));
    GlobalLockGuard lock(medium.get().hGlobal);
    ASSERT_GE(lock.size(), sizeof(UINT) + 4 * sizeof(FILEDESCRIPTORW));
    const auto* group = static_cast<const FILEGROUPDESCRIPTORW*>(lock.data());
    ASSERT_EQ(4u, group->cItems);
    EXPECT_STREQ(L"file1.lv", group->fgd[0].cFileName);
    EXPECT_STREQ(L"file1.hvr", group->fgd[1].cFileName);
    EXPECT_STREQ(L"file1.lv", group->fgd[2].cFileName) << "a station that cannot be loaded";
    EXPECT_STREQ(L"file1.lv", group->fgd[3].cFileName) << "a list without a station";
    EXPECT_EQ(0u, group->fgd[0].dwFlags) << "no size, time or attributes are announced";

    ComPtr<IDataObject> empty = Over({});
    UniqueStgMedium none;
    EXPECT_EQ(S_FALSE, empty->GetData(&format, none.put()));
}

TEST_F(DataObject, FileContentsRefusesBadIndexesAndItemsThatAreNotFiles) {
    ScriptedDialogs dialogs(IDOK);
    ScopedUserInterface scope(dialogs);
    ComPtr<IDataObject> data =
        Over({L"Quorvel Digital Level\\North\\file1.lv", L"Quorvel Digital Level\\North",
              L"Quorvel Digital Level\\Gone\\file1.lv"});
    for (LONG index : {-1L, 3L, 1L}) {
        FORMATETC format = Request(CFSTR_FILECONTENTS, TYMED_ISTREAM, index);
        UniqueStgMedium medium;
        EXPECT_EQ(S_FALSE, data->GetData(&format, medium.put())) << index;
    }
    FORMATETC gone = Request(CFSTR_FILECONTENTS, TYMED_ISTREAM, 2);
    UniqueStgMedium medium;
    EXPECT_EQ(E_FAIL, data->GetData(&gone, medium.put())) << "the store's own status";
    EXPECT_EQ(0, dialogs.runs) << "no download was started";
}

TEST_F(DataObject, ShellIdListArrayOfThreeItemsKeepsItsHistoricOffsets) {
    ComPtr<IDataObject> data =
        Over({L"Quorvel Digital Level\\North", L"Quorvel Digital Level\\South",
              L"Quorvel Digital Level\\East"});
    FORMATETC format = Request(CFSTR_SHELLIDLIST, TYMED_HGLOBAL);
    UniqueStgMedium medium;
    ASSERT_EQ(S_OK, data->GetData(&format, medium.put()));
    GlobalLockGuard lock(medium.get().hGlobal);
    const auto* bytes = static_cast<const BYTE*>(lock.data());
    const auto* array = static_cast<const CIDA*>(lock.data());
    ASSERT_EQ(3u, array->cidl);
    EXPECT_EQ(4u * 3 + 8, array->aoffset[0]);
    const UINT* offsets = array->aoffset;
    EXPECT_EQ(0u, offsets[2]);
    EXPECT_EQ(0u, offsets[3]);

    const auto* parent = reinterpret_cast<LPCITEMIDLIST>(bytes + offsets[0]);
    EXPECT_EQ(1u, manager_.GetItemCount(parent));
    EXPECT_EQ(L"Quorvel Digital Level", manager_.GetItemName(parent));
    const auto* child = reinterpret_cast<LPCITEMIDLIST>(bytes + offsets[1]);
    EXPECT_EQ(L"East", manager_.GetItemName(child)) << "the slot holds the last item's child";
    EXPECT_GE(lock.size(), offsets[1] + manager_.GetSize(child))
        << "the last child lies inside the block";

    ComPtr<IDataObject> rootOnly = Over({L"Quorvel Digital Level"});
    UniqueStgMedium none;
    EXPECT_EQ(S_FALSE, rootOnly->GetData(&format, none.put())) << "no parent";
}

TEST_F(DataObject, StationListCarriesTheLoadableStations) {
    ComPtr<IDataObject> data =
        Over({L"Quorvel Digital Level\\South", L"Quorvel Digital Level\\Gone",
              L"Quorvel Digital Level\\North\\file1.lv"});
    FORMATETC format = Request(L"Quorvel Total Stations", TYMED_HGLOBAL);
    UniqueStgMedium medium;
    ASSERT_EQ(S_OK, data->GetData(&format, medium.put()));
    std::vector<Station> stations;
    ASSERT_EQ(S_OK, ParseStationList(medium.get().hGlobal, stations));
    ASSERT_EQ(2u, stations.size());
    EXPECT_EQ(L"South", stations[0].Name);
    EXPECT_EQ(L"Quorvel LV-30", stations[0].Model);
    EXPECT_EQ(L"COM5", stations[0].Port);
    EXPECT_EQ(L"North", stations[1].Name);

    ComPtr<IDataObject> empty = Over({});
    UniqueStgMedium block;
    ASSERT_EQ(S_OK, empty->GetData(&format, block.put()));
    ASSERT_EQ(S_OK, ParseStationList(block.get().hGlobal, stations));
    EXPECT_TRUE(stations.empty());
}

TEST_F(DataObject, TravelsThroughTheOleClipboard) {
    ComPtr<IDataObject> data = Over({L"Quorvel Digital Level\\South\\file1.hvr"});
    ASSERT_EQ(S_OK, ::OleSetClipboard(data.Get()));
    data.Reset();
    {
        ComPtr<IDataObject> pasted;
        ASSERT_EQ(S_OK, ::OleGetClipboard(&pasted));
        FORMATETC format = Request(L"Quorvel Total Stations", TYMED_HGLOBAL);
        UniqueStgMedium medium;
        ASSERT_EQ(S_OK, pasted->GetData(&format, medium.put()));
        std::vector<Station> stations;
        ASSERT_EQ(S_OK, ParseStationList(medium.get().hGlobal, stations));
        ASSERT_EQ(1u, stations.size());
        EXPECT_EQ(L"South", stations[0].Name);
    }
    ASSERT_EQ(S_OK, ::OleSetClipboard(nullptr));
}

TEST_F(DataObject, DropSourceEndsOnButtonRelease) {
    auto object = MakeComObject<CLVDataObject>();
    EXPECT_EQ(S_OK, object->QueryContinueDrag(FALSE, MK_LBUTTON));
    EXPECT_EQ(DRAGDROP_S_DROP, object->QueryContinueDrag(FALSE, 0));
    EXPECT_EQ(DRAGDROP_S_CANCEL, object->QueryContinueDrag(TRUE, MK_LBUTTON));
}
