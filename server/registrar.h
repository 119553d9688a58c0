// The registrar: runs parsed registry scripts and the type library resource in both directions.
#pragma once

#include <windows.h>

#include <string_view>
#include <vector>

#include "server/portable/registry_script.h"

enum class RegistrationMode { Register, Unregister };

// Registering walks the keys parent first: a ForceRemove key is deleted with its subtree before
// it is created again, then the key's default value and named values are written.
// Unregistering walks them children first: a ForceRemove key is deleted with its subtree; any
// other key loses the named values the script gave it, and a key without NoRemove is deleted
// when nothing but what the script made is left in it (no subkeys). Keys and values that are
// already gone are not failures.
[[nodiscard]] HRESULT ApplyRegistryOperations(const std::vector<RegistryKeyOperation>& operations,
                                              RegistrationMode mode) noexcept;

// Parses the whole script first; a malformed script writes nothing and gives
// HRESULT_FROM_WIN32(ERROR_INVALID_DATA).
[[nodiscard]] HRESULT RunRegistryScript(std::wstring_view script,
                                        const std::vector<RegistryScriptReplacement>& replacements,
                                        RegistrationMode mode) noexcept;

// Parses the "REGISTRY" resource of this id (module may be loaded as a data file) with %MODULE%
// standing for modulePath; a missing or malformed script gives no operations and a failure.
[[nodiscard]] HRESULT ParseRegistryResource(HMODULE module, UINT resourceId,
                                            std::wstring_view modulePath,
                                            std::vector<RegistryKeyOperation>& operations) noexcept;

// Runs the module's "REGISTRY" resource of this id with %MODULE% standing for the module's path.
[[nodiscard]] HRESULT RunRegistryResource(HMODULE module, UINT resourceId,
                                          RegistrationMode mode) noexcept;

// Registers or unregisters the type library resource of the module (its first TYPELIB).
[[nodiscard]] HRESULT RegisterModuleTypeLibrary(HMODULE module, RegistrationMode mode) noexcept;
