// The module's registry keys flattened into the values an installer package writes, and their
// WiX and formatted-string escaping.
#include "server/portable/installer_registry.h"

#include <cstdio>

namespace {

const char* RootName(RegistryRoot root) {
    switch (root) {
        case RegistryRoot::ClassesRoot:
            return "HKCR";
        case RegistryRoot::CurrentUser:
            return "HKCU";
        case RegistryRoot::LocalMachine:
            return "HKLM";
        case RegistryRoot::Users:
            return "HKU";
        case RegistryRoot::CurrentConfig:
            break;  // an installer has no such root
    }
    return nullptr;
}

std::string Narrow(WideStringView text) {
    std::string result;
    for (size_t index = 0; index < text.size(); ++index) {
        uint32_t code = static_cast<uint16_t>(text[index]);
        if (code >= 0xD800 && code < 0xDC00 && index + 1 < text.size()) {
            const uint32_t low = static_cast<uint16_t>(text[index + 1]);
            if (low >= 0xDC00 && low < 0xE000) {
                code = 0x10000 + ((code - 0xD800) << 10) + (low - 0xDC00);
                ++index;
            }
        }
        if (code < 0x80) {
            result += static_cast<char>(code);
        } else if (code < 0x800) {
            result += static_cast<char>(0xC0 | (code >> 6));
            result += static_cast<char>(0x80 | (code & 0x3F));
        } else if (code < 0x10000) {
            result += static_cast<char>(0xE0 | (code >> 12));
            result += static_cast<char>(0x80 | ((code >> 6) & 0x3F));
            result += static_cast<char>(0x80 | (code & 0x3F));
        } else {
            result += static_cast<char>(0xF0 | (code >> 18));
            result += static_cast<char>(0x80 | ((code >> 12) & 0x3F));
            result += static_cast<char>(0x80 | ((code >> 6) & 0x3F));
            result += static_cast<char>(0x80 | (code & 0x3F));
        }
    }
    return result;
}

// Square brackets start a property reference in the installer's formatted text. Then the XML
// escapes. All of them are ASCII, so the text is escaped as UTF-16 and encoded once.
WideString EscapePiece(WideStringView text) {
    WideString result;
    for (WideChar c : text) {
        switch (c) {
            case '[':
                result += WIDE_TEXT("[\\[]");
                break;
            case ']':
                result += WIDE_TEXT("[\\]]");
                break;
            case '&':
                result += WIDE_TEXT("&amp;");
                break;
            case '<':
                result += WIDE_TEXT("&lt;");
                break;
            case '>':
                result += WIDE_TEXT("&gt;");
                break;
            case '"':
                result += WIDE_TEXT("&quot;");
                break;
            default:
                result += c;
        }
    }
    return result;
}

// The text escaped, with every placeholder replaced by reference as it stands; a value that
// begins with '#' would be read as a number, so its '#' is doubled.
std::string Escape(WideStringView text, WideStringView placeholder, const std::string& reference,
                   bool leadingHash) {
    std::string result = leadingHash && !text.empty() && text[0] == '#' ? "#" : "";
    for (size_t start = 0;;) {
        const size_t found =
            placeholder.empty() ? WideStringView::npos : text.find(placeholder, start);
        result += Narrow(EscapePiece(text.substr(start, found - start)));
        if (found == WideStringView::npos)
            return result;
        result += reference;
        start = found + placeholder.size();
    }
}

WideChar Lower(WideChar c) {
    return c >= 'A' && c <= 'Z' ? static_cast<WideChar>(c - 'A' + 'a') : c;
}

bool IsAtOrBelow(const InstallerRegistryValue& value, RegistryRoot root, const WideString& key) {
    return value.key.size() >= key.size() &&
           SameRegistryKey(value.root, WideStringView(value.key).substr(0, key.size()), root,
                           key) &&
           (value.key.size() == key.size() || value.key[key.size()] == '\\');
}

}  // namespace

bool SameRegistryKey(RegistryRoot leftRoot, WideStringView left, RegistryRoot rightRoot,
                     WideStringView right) {
    if (leftRoot != rightRoot || left.size() != right.size())
        return false;
    for (size_t index = 0; index < left.size(); ++index) {
        if (Lower(left[index]) != Lower(right[index]))
            return false;
    }
    return true;
}

void AppendInstallerValues(const std::vector<RegistryKeyOperation>& operations,
                           std::vector<InstallerRegistryValue>& values) {
    const auto add = [&](const RegistryKeyOperation& key, const RegistryScriptValue& value) {
        InstallerRegistryValue result;
        result.root = key.root;
        result.key = key.path;
        result.name = value.name;
        result.type = value.type == RegistryValueType::Dword ? InstallerValueType::Integer
                                                               : InstallerValueType::String;
        result.text = value.text;
        result.number = value.number;
        values.push_back(std::move(result));
    };
    for (const RegistryKeyOperation& key : operations) {
        if (key.defaultValue)
            add(key, *key.defaultValue);
        for (const RegistryScriptValue& value : key.values)
            add(key, value);
    }
}

WideString FindKeyLeftEmpty(const std::vector<RegistryKeyOperation>& operations,
                            const std::vector<InstallerRegistryValue>& values) {
    for (const RegistryKeyOperation& key : operations) {
        if (key.noRemove)
            continue;
        bool holdsValue = false;
        for (const InstallerRegistryValue& value : values)
            holdsValue = holdsValue || IsAtOrBelow(value, key.root, key.path);
        if (!holdsValue)
            return key.path;
    }
    return {};
}

bool WriteWixRegistryInclude(const std::vector<InstallerRegistryValue>& values,
                             WideStringView placeholder, const std::string& reference,
                             const std::string& idPrefix, const std::string& comment,
                             std::string& include,
                             std::string& error) {
    std::string text = "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<!-- " + comment +
                       " -->\n<Include>\n";
    size_t number = 0;
    for (const InstallerRegistryValue& value : values) {
        const char* root = RootName(value.root);
        if (!root) {
            error = "no installer root for the key " + Narrow(value.key);
            return false;
        }
        if (value.type == InstallerValueType::String && value.text.empty()) {
            // An empty string reads as "no value" to the installer: the package would write
            // nothing where the module writes an empty text.
            error = "an empty text under " + Narrow(value.key) + " has no installer form";
            return false;
        }
        // Explicit identifiers: the packager's own are made from the key and name, which two
        // modules of one package (x64 and x86) share.
        text += std::string("  <RegistryValue Id=\"") +
                (value.type == InstallerValueType::Binary ? "binary_" : "registry_") + idPrefix +
                "_" + std::to_string(++number) + "\"";
        text += std::string(" Root=\"") + root + "\" Key=\"" +
                Escape(value.key, placeholder, reference, false) + "\"";
        if (!value.name.empty())
            text += " Name=\"" + Escape(value.name, placeholder, reference, false) + "\"";
        switch (value.type) {
            case InstallerValueType::String:
                text += " Type=\"string\" Value=\"" +
                        Escape(value.text, placeholder, reference, true) + "\"";
                break;
            case InstallerValueType::Integer:
                text += " Type=\"integer\" Value=\"" + std::to_string(value.number) + "\"";
                break;
            case InstallerValueType::Binary: {
                text += " Type=\"binary\" Value=\"";
                for (uint8_t byte : value.bytes) {
                    char hex[3];
                    std::snprintf(hex, sizeof hex, "%02X", byte);
                    text += hex;
                }
                text += "\"";
                break;
            }
        }
        text += "/>\n";
    }
    include = text + "</Include>\n";
    return true;
}
