// Registry scripts: the text form of the module's registration, parsed into key operations.
//
// A script names root keys, each followed by a braced list of entries:
//
//   HKCR
//   {
//       NoRemove CLSID
//       {
//           ForceRemove {GUID} = s 'Description'
//           {
//               InprocServer32 = s '%MODULE%'
//               {
//                   val ThreadingModel = s 'Apartment'
//               }
//           }
//       }
//   }
//
// An entry is a key (optionally marked NoRemove or ForceRemove, optionally with a default value
// and a braced list of its own entries) or a named value "val Name = s 'text'" / "= d 'number'".
// The whole script is parsed before anything is written, so a malformed script writes nothing.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "support/portable/wide_text.h"

enum class RegistryRoot : uint8_t { ClassesRoot, CurrentUser, LocalMachine, Users, CurrentConfig };

enum class RegistryValueType : uint8_t { String, Dword };

struct RegistryScriptValue {
    WideString name;  // empty for a key's default value
    RegistryValueType type = RegistryValueType::String;
    WideString text;      // for String
    uint32_t number = 0;  // for Dword

    bool operator==(const RegistryScriptValue&) const = default;
};

// One key of the script, in the order the script names them (a parent before its children).
struct RegistryKeyOperation {
    RegistryRoot root = RegistryRoot::ClassesRoot;
    WideString path;   // below the root, components joined by "\"
    size_t depth = 0;  // 1 for a key written directly under the root
    bool noRemove = false;
    bool forceRemove = false;
    std::optional<RegistryScriptValue> defaultValue;
    std::vector<RegistryScriptValue> values;  // the "val" entries, in script order
};

// A %NAME% placeholder and the text that replaces it (the name without its percent signs).
struct RegistryScriptReplacement {
    WideString name;
    WideString value;
};

struct RegistryScriptError {
    size_t line = 0;  // 1-based line of the offending token; 0 when not tied to a line
    std::string message;
};

// Longest key name component the registry accepts.
constexpr size_t kMaxRegistryKeyNameLength = 255;
// Deepest nesting of braces a script may use.
constexpr size_t kMaxRegistryScriptDepth = 32;

// Parses a whole script. Placeholders are replaced inside names and value texts after the
// script's structure has been read, so a replacement text (a module path) can never change it.
// On failure the operations are left empty and the error says where and why.
[[nodiscard]] bool ParseRegistryScript(WideStringView script,
                                       const std::vector<RegistryScriptReplacement>& replacements,
                                       std::vector<RegistryKeyOperation>& operations,
                                       RegistryScriptError& error);

// Turns the bytes of a script resource into text: UTF-16LE after the byte-order mark FF FE, else
// 7-bit ASCII. A byte above 0x7F, an odd UTF-16 length or a zero followed by anything but zeros
// (padding) fails.
[[nodiscard]] bool DecodeRegistryScriptBytes(const uint8_t* bytes, size_t count, WideString& text);
