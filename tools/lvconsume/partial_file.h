// The download's file in the target folder under a temporary name, renamed to its own name only
// once it is complete: any other end deletes it, so that a short download never looks like a file.
#pragma once

#include <windows.h>
#include <objidl.h>
#include <wrl/client.h>

#include <string>

class PartialFile {
public:
    PartialFile() = default;
    PartialFile(const PartialFile&) = delete;
    PartialFile& operator=(const PartialFile&) = delete;
    ~PartialFile() { Discard(); }

    // A new, empty file of a temporary name in folder.
    [[nodiscard]] HRESULT Create(const std::wstring& folder) noexcept;
    const std::wstring& path() const noexcept { return path_; }
    IStream* stream() const noexcept { return stream_.Get(); }

    // Closes the file and gives it its final name, replacing a file of that name.
    [[nodiscard]] HRESULT Commit(const std::wstring& target) noexcept;
    void Discard() noexcept;

private:
    std::wstring path_;
    Microsoft::WRL::ComPtr<IStream> stream_;
};
