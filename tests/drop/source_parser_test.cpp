// The parser of dropped sources over real files in the prefix and data objects built here: files,
// shortcuts, folders, file group descriptors, shell items, the hand-over to another thread, and
// blocks that lie.
#include "tests/drop/drop_fixture.h"

#include <thread>

#include "support/error_log.h"
#include "tests/portable/file_group_block.h"
#include "view/lv_drop_target.h"

namespace {

class SourceParserTest : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(S_OK, ::OleInitialize(nullptr)); }
    void TearDown() override { ::OleUninitialize(); }

    static std::vector<TSourceDescriptor> Parse(IDataObject* data, HRESULT expected = S_OK,
                                                bool deep = true) {
        TSourceParser parser(true);
        EXPECT_EQ(expected, parser.ParseDataObject(data, L"", deep));
        return *parser.Sources();
    }

    ScratchFolder scratch_;
};

TEST_F(SourceParserTest, DroppedFilesAreEachTheirOwnRoot) {
    const std::wstring first = scratch_.File(L"a.lv");
    const std::wstring second = scratch_.File(L"b.txt");
    const auto data = FileListObject({first, second});
    EXPECT_EQ(S_OK, AcceptDropSource(data.Get()));
    EXPECT_EQ((std::vector<TSourceDescriptor>{{first, first, 0}, {second, second, 0}}),
              Parse(data.Get()));
}

TEST_F(SourceParserTest, AShortcutToAFolderWalksItWithTheFolderAsRoot) {
    const std::wstring target = scratch_.Folder(L"survey");
    const std::wstring inner = scratch_.File(L"survey\\day1.lv");
    scratch_.Folder(L"survey\\old");
    const std::wstring nested = scratch_.File(L"survey\\old\\day0.lv");
    // A shortcut back to the folder's parent inside it: the walk must still end.
    scratch_.Shortcut(L"survey\\up.lnk", scratch_.Path());
    const std::wstring link = scratch_.Shortcut(L"survey.lnk", target);
    // A shortcut whose target is gone is dropped as the file it is.
    const std::wstring gone = scratch_.Shortcut(L"gone.lnk", scratch_.File(L"temporary.lv"));
    ::DeleteFileW((scratch_.Path() + L"\\temporary.lv").c_str());
    TSourceParser parser(true);
    EXPECT_EQ(S_OK, parser.ParseDataObject(FileListObject({link, gone}).Get(), L"", true));
    const std::vector<TSourceDescriptor> sources = *parser.Sources();
    ASSERT_GE(sources.size(), 3u);
    EXPECT_EQ((TSourceDescriptor{target, inner, 0}), sources[0]);
    EXPECT_EQ((TSourceDescriptor{target, nested, 0}), sources[1]);
    EXPECT_EQ((TSourceDescriptor{gone, gone, 0}), sources.back());
    // Each file once, however the shortcut inside loops back.
    const auto count = [&](const std::wstring& path) {
        return std::count_if(sources.begin(), sources.end(),
                             [&](const TSourceDescriptor& source) { return source.path == path; });
    };
    EXPECT_EQ(1, count(inner));
    EXPECT_EQ(1, count(nested));
    EXPECT_GE(parser.FolderCount(), 2u);
}

TEST_F(SourceParserTest, AVeryDeepFolderIsWalkedDownToTheDepthLimitOnly) {
    std::wstring relative = L"deep";
    scratch_.Folder(relative);
    std::wstring shallow, tooDeep;
    for (int depth = 1; depth <= kMaximumSourceDepth + 4; ++depth) {
        relative += L"\\d";
        scratch_.Folder(relative);
        if (depth == 8)
            shallow = scratch_.File(relative + L"\\near.lv");
    }
    tooDeep = scratch_.File(relative + L"\\far.lv");
    const std::wstring top = scratch_.Path() + L"\\deep";
    EXPECT_EQ((std::vector<TSourceDescriptor>{{top, shallow, 0}}),
              Parse(FileListObject({top}).Get()))
        << "beyond the limit: " << tooDeep.size();
}

TEST_F(SourceParserTest, FileGroupsSkipDirectoriesAndKeepTheIndexes) {
    for (bool wide : {true, false}) {
        auto data = MakeComObject<BlockDataObject>();
        data->blocks[wide ? RegisteredFormat(ClipboardFormat::FileGroupDescriptor)
                          : RegisteredFormat(ClipboardFormat::AnsiFileGroupDescriptor)] =
            FileGroup(
                wide,
                {{0, 0, L"one.lv"}, {1, FILE_ATTRIBUTE_DIRECTORY, L"folder"}, {2, 0, L"two.lv"}});
        EXPECT_EQ((std::vector<TSourceDescriptor>{{L"", L"one.lv", 0}, {L"", L"two.lv", 2}}),
                  Parse(data.Get()))
            << wide;
    }
}

TEST_F(SourceParserTest, DropSourcesAreAcceptedByTheirFormats) {
    const CLIPFORMAT group = RegisteredFormat(ClipboardFormat::FileGroupDescriptor);
    const struct {
        const char* what;
        std::vector<CLIPFORMAT> formats;
        bool contents;
        HRESULT expected;
    } cases[] = {
        {"files", {CF_HDROP}, false, S_OK},
        {"shell items", {RegisteredFormat(ClipboardFormat::ShellIdList)}, false, S_OK},
        {"virtual files with contents", {group}, true, S_OK},
        {"virtual files without contents", {group}, false, E_INVALIDARG},
        {"text", {CF_UNICODETEXT}, false, E_INVALIDARG},
    };
    for (const auto& c : cases) {
        auto data = MakeComObject<BlockDataObject>();
        for (CLIPFORMAT format : c.formats)
            data->blocks[format] = Bytes(8);
        data->contents = c.contents;
        EXPECT_EQ(c.expected, AcceptDropSource(data.Get())) << c.what;
    }
}

TEST_F(SourceParserTest, ShellItemsUnderARealFolderAreParsedAsTheirFiles) {
    const std::wstring first = scratch_.File(L"x.lv");
    const std::wstring second = scratch_.File(L"y.lv");
    UniqueAbsoluteIdList folder, one, two;
    ASSERT_EQ(S_OK,
              ::SHParseDisplayName(scratch_.Path().c_str(), nullptr, folder.put(), 0, nullptr));
    ASSERT_EQ(S_OK, ::SHParseDisplayName(first.c_str(), nullptr, one.put(), 0, nullptr));
    ASSERT_EQ(S_OK, ::SHParseDisplayName(second.c_str(), nullptr, two.put(), 0, nullptr));
    auto data = MakeComObject<BlockDataObject>();
    data->blocks[RegisteredFormat(ClipboardFormat::ShellIdList)] =
        IdListArrayBlock(folder.get(), {::ILFindLastID(one.get()), ::ILFindLastID(two.get())});
    EXPECT_EQ((std::vector<TSourceDescriptor>{{first, first, 0}, {second, second, 0}}),
              Parse(data.Get()));
    // Not deep: shell items are not opened, and a source with nothing else gives nothing.
    EXPECT_TRUE(Parse(data.Get(), DV_E_FORMATETC, false).empty());
}

TEST_F(SourceParserTest, TheDataObjectCanBeFetchedOnceOnAnotherThread) {
    const auto data = FileListObject({scratch_.File(L"z.lv")});
    TSourceParser parser(true);
    ComPtr<IDataObject> none;
    EXPECT_EQ(S_FALSE, parser.GetDataObject(&none));
    ASSERT_EQ(S_OK, parser.ParseDataObject(data.Get(), L"", true));
    HRESULT first = E_FAIL, second = E_FAIL, query = E_FAIL;
    UniqueHandle finished(::CreateEventW(nullptr, TRUE, FALSE, nullptr));
    std::thread worker([&] {
        ::CoInitializeEx(nullptr, COINIT_MULTITHREADED);
        {
            ComPtr<IDataObject> fetched, again;
            first = parser.GetDataObject(&fetched);
            FORMATETC format{CF_HDROP, nullptr, DVASPECT_CONTENT, -1, TYMED_HGLOBAL};
            if (fetched)
                query = fetched->QueryGetData(&format);
            second = parser.GetDataObject(&again);
        }
        ::CoUninitialize();
        ::SetEvent(finished.get());
    });
    // The proxy calls back into this apartment: keep its messages flowing.
    const HANDLE waitFor = finished.get();
    while (::MsgWaitForMultipleObjects(1, &waitFor, FALSE, 5000, QS_ALLINPUT) ==
           WAIT_OBJECT_0 + 1) {
        MSG message;
        while (::PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE))
            ::DispatchMessageW(&message);
    }
    worker.join();
    EXPECT_EQ(S_OK, first);
    EXPECT_EQ(S_OK, query);
    EXPECT_EQ(S_FALSE, second);
    EXPECT_EQ(E_INVALIDARG, parser.GetDataObject(nullptr));
}

// Every way a block can lie is the portable readers' tests; here each format's block reaches its
// reader with the block's own size.
TEST_F(SourceParserTest, BlocksThatLieAreReadOnlyWithinThemselves) {
    Bytes pastTheEnd = DropFilesBlock({scratch_.File(L"real.lv")});
    reinterpret_cast<DROPFILES*>(pastTheEnd.data())->pFiles = 4096;
    Bytes group = FileGroup(true, {{0, 0, L"a.lv"}});
    *reinterpret_cast<UINT*>(group.data()) = 100000;  // far more records than the block holds
    const struct {
        const char* what;
        CLIPFORMAT format;
        Bytes block;
        size_t sources;
    } cases[] = {
        {"file list offset past the block", CF_HDROP, pastTheEnd, 0},
        {"file group announcing too many records",
         RegisteredFormat(ClipboardFormat::FileGroupDescriptor), group, 1},
    };
    for (const auto& c : cases) {
        auto data = MakeComObject<BlockDataObject>();
        data->blocks[c.format] = c.block;
        TSourceParser parser(true);
        (void)parser.ParseDataObject(data.Get(), L"", true);
        EXPECT_EQ(c.sources, parser.Sources()->size()) << c.what;
    }
}

// The line of the first log entry that starts with the given source, result and function, as in
// "source_parser.cpp - 0x80070057 (ParseDataObject, 123)"; 0 when there is none.
int LoggedLine(const std::wstring& log, const wchar_t* function, HRESULT result) {
    wchar_t head[128];
    swprintf(head, 128, L"source_parser.cpp - 0x%08X (%ls, ", static_cast<unsigned>(result),
             function);
    const size_t at = log.find(head);
    if (at == std::wstring::npos)
        return 0;
    const wchar_t* number = log.c_str() + at + wcslen(head);
    wchar_t* end = nullptr;
    const long line = wcstol(number, &end, 10);
    return end != number && *end == L')' ? static_cast<int>(line) : 0;
}

TEST_F(SourceParserTest, RefusedCallsAreWrittenToTheErrorLogWhereTheyAreRefused) {
    ::SetEnvironmentVariableW(L"LVSHELLEXT_LOG_DIR", scratch_.Path().c_str());
    TSourceParser parser(true);
    EXPECT_EQ(E_INVALIDARG, parser.ParseDataObject(nullptr, L"", true));
    auto refusing = MakeComObject<BlockDataObject>();
    refusing->refuseMarshalling = true;
    const HRESULT marshalling = parser.ParseDataObject(refusing.Get(), L"", true);
    EXPECT_TRUE(FAILED(marshalling));
    EXPECT_EQ(E_INVALIDARG, parser.GetDataObject(nullptr));
    const std::wstring text = ReadWideFile(ErrorLogPath());
    ::SetEnvironmentVariableW(L"LVSHELLEXT_LOG_DIR", nullptr);
    ASSERT_FALSE(text.empty()) << "no error log";
    // Each entry names the file, the function and the line of its own check: three checks,
    // three lines, the marshalling after the null check as in the source.
    const int nullSource = LoggedLine(text, L"ParseDataObject", E_INVALIDARG);
    const int failedMarshalling = LoggedLine(text, L"ParseDataObject", marshalling);
    const int nullOut = LoggedLine(text, L"GetDataObject", E_INVALIDARG);
    EXPECT_GT(nullSource, 0) << "in the log: " << text.size();
    EXPECT_GT(failedMarshalling, nullSource);
    EXPECT_GT(nullOut, failedMarshalling);
}

}  // namespace
