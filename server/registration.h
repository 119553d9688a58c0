// Self-registration of the module: the class scripts, the type library and the folder's
// ShellFolder attributes.
#pragma once

#include <windows.h>

// The folder's ShellFolder Attributes: SFGAO_FOLDER | SFGAO_HASSUBFOLDER, stored as REG_BINARY.
inline constexpr BYTE kShellFolderAttributes[4] = {0x00, 0x00, 0x00, 0xA0};

// Runs every class's script and registers the type library; on failure returns that status and
// writes nothing more. Then writes the folder's Attributes (a failure there is not reported).
[[nodiscard]] HRESULT RegisterServer(HMODULE module) noexcept;

// Removes the classes' registrations (the first failure stops that step) and the type library,
// then removes the folder's Attributes value, which leaves an empty ShellFolder key behind.
// Always S_OK.
[[nodiscard]] HRESULT UnregisterServer(HMODULE module) noexcept;
