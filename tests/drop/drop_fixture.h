// What the drop tests hand to the parser and the targets: a data object of blocks built in the
// test (as any drag source could write them), and a scratch folder of real files.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <shlwapi.h>
#include <wrl/client.h>

#include <gtest/gtest.h>

#include <cstring>
#include <map>
#include <ostream>
#include <string>
#include <vector>

#include "support/clipboard_formats.h"
#include "support/com_object.h"
#include "support/unique_resource.h"
#include "view/source_parser.h"

using Microsoft::WRL::ComPtr;
using Bytes = std::vector<uint8_t>;

// Descriptors print as their text in failure messages.
inline void PrintTo(const TSourceDescriptor& source, std::ostream* out) {
    const auto narrow = [](const std::wstring& text) {
        std::string result;
        for (wchar_t c : text)
            result += c < 0x80 ? static_cast<char>(c) : '?';
        return result;
    };
    *out << "{\"" << narrow(source.rootPath) << "\", \"" << narrow(source.path) << "\", "
         << source.index << "}";
}

// HGLOBAL blocks by format; "FileContents" is announced as a stream when contents is set.
class BlockDataObject final : public ComObjectImpl<false, IDataObject, IMarshal> {
public:
    std::map<CLIPFORMAT, Bytes> blocks;
    bool contents = false;
    bool refuseMarshalling = false;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override {
        if (iid == IID_IMarshal && !refuseMarshalling) {
            *object = nullptr;
            return E_NOINTERFACE;  // the standard marshaller then
        }
        static const QITAB table[] = {QITABENT(BlockDataObject, IDataObject),
                                      QITABENT(BlockDataObject, IMarshal), {}};
        return QISearch(this, table, iid, object);
    }
    IFACEMETHODIMP GetData(FORMATETC* format, STGMEDIUM* medium) override {
        *medium = {};
        const auto found = blocks.find(format->cfFormat);
        if (found == blocks.end() || !(format->tymed & TYMED_HGLOBAL))
            return DV_E_FORMATETC;
        medium->tymed = TYMED_HGLOBAL;
        medium->hGlobal = ::GlobalAlloc(GMEM_MOVEABLE, found->second.size());
        GlobalLockGuard lock(medium->hGlobal);
        std::memcpy(lock.data(), found->second.data(), found->second.size());
        return S_OK;
    }
    IFACEMETHODIMP GetDataHere(FORMATETC*, STGMEDIUM*) override { return E_NOTIMPL; }
    IFACEMETHODIMP QueryGetData(FORMATETC* format) override {
        if (contents && format->cfFormat == RegisteredFormat(ClipboardFormat::FileContents))
            return (format->tymed & TYMED_ISTREAM) ? S_OK : DV_E_TYMED;
        return blocks.count(format->cfFormat) && (format->tymed & TYMED_HGLOBAL) ? S_OK
                                                                                 : DV_E_FORMATETC;
    }
    IFACEMETHODIMP GetCanonicalFormatEtc(FORMATETC*, FORMATETC*) override { return E_NOTIMPL; }
    IFACEMETHODIMP SetData(FORMATETC*, STGMEDIUM*, BOOL) override { return E_NOTIMPL; }
    IFACEMETHODIMP EnumFormatEtc(DWORD, IEnumFORMATETC** enumerator) override {
        std::vector<FORMATETC> formats;
        for (const auto& block : blocks)
            formats.push_back({block.first, nullptr, DVASPECT_CONTENT, -1, TYMED_HGLOBAL});
        return ::SHCreateStdEnumFmtEtc(static_cast<UINT>(formats.size()), formats.data(),
                                       enumerator);
    }
    IFACEMETHODIMP DAdvise(FORMATETC*, DWORD, IAdviseSink*, DWORD*) override { return E_NOTIMPL; }
    IFACEMETHODIMP DUnadvise(DWORD) override { return E_NOTIMPL; }
    IFACEMETHODIMP EnumDAdvise(IEnumSTATDATA**) override { return E_NOTIMPL; }

    // A custom marshaller that refuses: the parser's marshalling for other threads fails.
    IFACEMETHODIMP GetUnmarshalClass(REFIID, void*, DWORD, void*, DWORD, CLSID*) override {
        return E_FAIL;
    }
    IFACEMETHODIMP GetMarshalSizeMax(REFIID, void*, DWORD, void*, DWORD, DWORD*) override {
        return E_FAIL;
    }
    IFACEMETHODIMP MarshalInterface(IStream*, REFIID, void*, DWORD, void*, DWORD) override {
        return E_FAIL;
    }
    IFACEMETHODIMP UnmarshalInterface(IStream*, REFIID, void**) override { return E_FAIL; }
    IFACEMETHODIMP ReleaseMarshalData(IStream*) override { return E_FAIL; }
    IFACEMETHODIMP DisconnectObject(DWORD) override { return E_FAIL; }
};

// A CF_HDROP block of wide paths.
inline Bytes DropFilesBlock(const std::vector<std::wstring>& paths) {
    Bytes block(sizeof(DROPFILES));
    auto* header = reinterpret_cast<DROPFILES*>(block.data());
    header->pFiles = sizeof(DROPFILES);
    header->fWide = TRUE;
    for (const std::wstring& path : paths) {
        const auto* bytes = reinterpret_cast<const uint8_t*>(path.c_str());
        block.insert(block.end(), bytes, bytes + (path.size() + 1) * sizeof(wchar_t));
    }
    block.insert(block.end(), {0, 0});
    return block;
}

// A data object holding only a drag source's file list of these paths.
inline ComPtr<BlockDataObject> FileListObject(const std::vector<std::wstring>& paths) {
    auto data = MakeComObject<BlockDataObject>();
    data->blocks[CF_HDROP] = DropFilesBlock(paths);
    return data;
}

// A UTF-16 file's text (the error log's), empty when it cannot be opened.
inline std::wstring ReadWideFile(const std::wstring& path) {
    UniqueFileHandle file(::CreateFileW(path.c_str(), GENERIC_READ,
                                        FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr, OPEN_EXISTING,
                                        0, nullptr));
    if (!file)
        return {};
    std::wstring text(::GetFileSize(file.get(), nullptr) / sizeof(wchar_t), L'\0');
    DWORD read = 0;
    ::ReadFile(file.get(), text.data(), static_cast<DWORD>(text.size() * sizeof(wchar_t)), &read,
               nullptr);
    return text;
}

// A "Shell IDList Array" of a parent folder and its children, from their absolute lists.
inline Bytes IdListArrayBlock(PCIDLIST_ABSOLUTE parent, const std::vector<PCUITEMID_CHILD>& items) {
    std::vector<UINT> offsets;
    const UINT headerSize = static_cast<UINT>(sizeof(UINT) * (items.size() + 2));
    Bytes lists;
    const auto append = [&](const void* list) {
        offsets.push_back(headerSize + static_cast<UINT>(lists.size()));
        const auto* bytes = static_cast<const uint8_t*>(list);
        lists.insert(lists.end(), bytes, bytes + ::ILGetSize(static_cast<PCUIDLIST_RELATIVE>(list)));
    };
    append(parent);
    for (PCUITEMID_CHILD item : items)
        append(item);
    Bytes block(headerSize);
    auto* array = reinterpret_cast<UINT*>(block.data());
    array[0] = static_cast<UINT>(items.size());
    std::memcpy(array + 1, offsets.data(), offsets.size() * sizeof(UINT));
    block.insert(block.end(), lists.begin(), lists.end());
    return block;
}

// A scratch folder of real files under the temporary folder, removed with its contents.
class ScratchFolder {
public:
    ScratchFolder() {
        wchar_t temporary[MAX_PATH] = {};
        ::GetTempPathW(MAX_PATH, temporary);
        path_ = std::wstring(temporary) + L"lvdrop" + std::to_wstring(::GetTickCount64());
        ::CreateDirectoryW(path_.c_str(), nullptr);
    }
    ~ScratchFolder() {
        std::wstring from = path_ + L'\0';
        SHFILEOPSTRUCTW remove{};
        remove.wFunc = FO_DELETE;
        remove.pFrom = from.c_str();
        remove.fFlags = FOF_NO_UI;
        ::SHFileOperationW(&remove);
    }
    const std::wstring& Path() const { return path_; }
    std::wstring File(const std::wstring& relative) const {
        const std::wstring full = path_ + L"\\" + relative;
        UniqueFileHandle file(::CreateFileW(full.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS,
                                            FILE_ATTRIBUTE_NORMAL, nullptr));
        EXPECT_TRUE(file) << "cannot create " << std::string(full.begin(), full.end());
        return full;
    }
    std::wstring Folder(const std::wstring& relative) const {
        const std::wstring full = path_ + L"\\" + relative;
        ::CreateDirectoryW(full.c_str(), nullptr);
        return full;
    }
    // A shortcut at relative pointing to target, made with the shell link object.
    std::wstring Shortcut(const std::wstring& relative, const std::wstring& target) const {
        const std::wstring full = path_ + L"\\" + relative;
        ComPtr<IShellLinkW> link;
        EXPECT_EQ(S_OK, ::CoCreateInstance(CLSID_ShellLink, nullptr, CLSCTX_INPROC_SERVER,
                                           IID_PPV_ARGS(&link)));
        EXPECT_EQ(S_OK, link->SetPath(target.c_str()));
        ComPtr<IPersistFile> file;
        EXPECT_EQ(S_OK, link.As(&file));
        EXPECT_EQ(S_OK, file->Save(full.c_str(), TRUE));
        return full;
    }

private:
    std::wstring path_;
};
