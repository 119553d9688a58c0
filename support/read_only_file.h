// Opening a file to read it whole: the handle and the size, or the system's reason why not.
#pragma once

#include <windows.h>

#include <cstdint>
#include <string>

#include "support/unique_resource.h"

// Opens path for reading, sharing it only with other readers (a writer that still holds it makes
// the open fail), and takes its size. The HRESULT of the failing call otherwise.
[[nodiscard]] HRESULT OpenReadOnlyFile(const std::wstring& path, UniqueFileHandle& file,
                                       uint64_t& size) noexcept;
