// The module's registration as an installer package writes it: the keys of the registry scripts
// flattened into values, written out as WiX RegistryValue elements.
//
// A package removes on uninstall what it wrote, and a key that ends up empty goes with it, which
// is what unregistration does for every key not marked NoRemove. A package built from the same
// scripts that the module runs can therefore never disagree with the module's own registration.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "server/portable/registry_script.h"

enum class InstallerValueType : uint8_t { String, Integer, Binary };

struct InstallerRegistryValue {
    RegistryRoot root = RegistryRoot::ClassesRoot;
    WideString key;
    WideString name;  // empty for the key's default value
    InstallerValueType type = InstallerValueType::String;
    WideString text;             // String
    uint32_t number = 0;         // Integer
    std::vector<uint8_t> bytes;  // Binary

    bool operator==(const InstallerRegistryValue&) const = default;
};

// Appends the values that running these operations in registration mode writes, in script order.
void AppendInstallerValues(const std::vector<RegistryKeyOperation>& operations,
                           std::vector<InstallerRegistryValue>& values);

// Registry key names compare without regard to case (ASCII letters).
bool SameRegistryKey(RegistryRoot leftRoot, WideStringView left, RegistryRoot rightRoot,
                     WideStringView right);

// A package cannot create a bare key: the path of the first key that unregistration would delete
// (not NoRemove) but that holds no value, here or below it, among values; empty when there is none.
WideString FindKeyLeftEmpty(const std::vector<RegistryKeyOperation>& operations,
                            const std::vector<InstallerRegistryValue>& values);

// A WiX include of RegistryValue elements, UTF-8. Text is escaped for XML and for the installer's
// formatted strings; every occurrence of placeholder in a key or a value becomes reference (for
// example "[#LVShellExt]", the installed path of a file) unescaped. The values are numbered
// "registry_<idPrefix>_<n>", binary ones "binary_<idPrefix>_<n>" (scripts/package looks for
// those: the packager writes binary values as text).
[[nodiscard]] bool WriteWixRegistryInclude(const std::vector<InstallerRegistryValue>& values,
                                           WideStringView placeholder, const std::string& reference,
                                           const std::string& idPrefix, const std::string& comment,
                                           std::string& include, std::string& error);
