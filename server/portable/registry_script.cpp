// The registry-script tokenizer and parser.
#include "server/portable/registry_script.h"

#include <utility>

namespace {

struct Token {
    enum class Kind { End, Word, Quoted };
    Kind kind = Kind::End;
    WideString text;
    size_t line = 0;
};

bool IsSpace(WideChar c) noexcept {
    return c == ' ' || c == '\t' || c == '\r' || c == '\n';
}

WideChar AsciiUpper(WideChar c) noexcept {
    return (c >= 'a' && c <= 'z') ? static_cast<WideChar>(c - 'a' + 'A') : c;
}

// Keywords are matched without regard to case; the names of keys and values keep theirs.
bool EqualsKeyword(const Token& token, const char* keyword) noexcept {
    if (token.kind != Token::Kind::Word)
        return false;
    size_t index = 0;
    for (; keyword[index] != 0; ++index) {
        if (index >= token.text.size() ||
            AsciiUpper(token.text[index]) != static_cast<WideChar>(keyword[index]))
            return false;
    }
    return index == token.text.size();
}

bool IsPunctuation(const Token& token, WideChar mark) noexcept {
    return token.kind == Token::Kind::Word && token.text.size() == 1 && token.text[0] == mark;
}

class Parser {
public:
    Parser(WideStringView script, const std::vector<RegistryScriptReplacement>& replacements,
           std::vector<RegistryKeyOperation>& operations, RegistryScriptError& error)
        : script_(script), replacements_(replacements), operations_(operations), error_(error) {}

    bool ParseScript() {
        for (;;) {
            Token rootToken = Next();
            if (failed_)
                return false;
            if (rootToken.kind == Token::Kind::End)
                return true;
            RegistryRoot root{};
            if (!RootFromToken(rootToken, root))
                return Fail(rootToken.line, "expected a root key such as HKCR or HKLM");
            Token open = Next();
            if (!IsPunctuation(open, '{'))
                return Fail(open.line, "expected '{' after the root key");
            if (!ParseEntries(root, WideString(), 1))
                return false;
        }
    }

private:
    // Reads the entries of one braced block, up to and including its closing brace.
    bool ParseEntries(RegistryRoot root, const WideString& parentPath, size_t depth) {
        if (depth > kMaxRegistryScriptDepth)
            return Fail(line_, "keys are nested too deeply");
        const size_t ownerIndex = operations_.size() - (depth > 1 ? 1 : 0);
        for (;;) {
            Token token = Next();
            if (failed_)
                return false;
            if (token.kind == Token::Kind::End)
                return Fail(token.line, "missing '}' at the end of the script");
            if (IsPunctuation(token, '}'))
                return true;
            if (EqualsKeyword(token, "VAL")) {
                if (depth == 1)
                    return Fail(token.line, "a value needs a key; roots hold keys only");
                if (!ParseNamedValue(operations_[ownerIndex]))
                    return false;
                continue;
            }
            if (!ParseKey(root, parentPath, depth, std::move(token)))
                return false;
        }
    }

    bool ParseNamedValue(RegistryKeyOperation& owner) {
        Token name = Next();
        if (!IsName(name))
            return Fail(name.line, "expected the value's name after 'val'");
        RegistryScriptValue value;
        if (!Expand(name, value.name))
            return false;
        Token equals = Next();
        if (!IsPunctuation(equals, '='))
            return Fail(equals.line, "expected '=' after the value's name");
        if (!ParseValueData(value))
            return false;
        owner.values.push_back(std::move(value));
        return true;
    }

    bool ParseKey(RegistryRoot root, const WideString& parentPath, size_t depth, Token token) {
        RegistryKeyOperation operation;
        operation.root = root;
        operation.depth = depth;
        while (EqualsKeyword(token, "NOREMOVE") || EqualsKeyword(token, "FORCEREMOVE")) {
            bool& flag =
                EqualsKeyword(token, "NOREMOVE") ? operation.noRemove : operation.forceRemove;
            if (flag)
                return Fail(token.line, "the same modifier is given twice");
            flag = true;
            token = Next();
        }
        if (operation.noRemove && operation.forceRemove)
            return Fail(token.line, "a key cannot be both NoRemove and ForceRemove");
        if (!IsName(token))
            return Fail(token.line, "expected a key name");
        WideString name;
        if (!Expand(token, name))
            return false;
        if (name.empty() || name.size() > kMaxRegistryKeyNameLength)
            return Fail(token.line, "a key name must have 1 to 255 characters");
        if (name.find('\\') != WideString::npos)
            return Fail(token.line, "a key name cannot hold '\\'; nest the keys instead");
        operation.path = parentPath.empty() ? name : parentPath + WIDE_TEXT("\\") + name;

        Token after = Next();
        if (IsPunctuation(after, '=')) {
            RegistryScriptValue value;
            if (!ParseValueData(value))
                return false;
            operation.defaultValue = std::move(value);
            after = Next();
        }
        const WideString path = operation.path;
        operations_.push_back(std::move(operation));
        if (IsPunctuation(after, '{'))
            return ParseEntries(root, path, depth + 1);
        Push(std::move(after));
        return !failed_;
    }

    // "s 'text'" or "d 'number'" (the number may also stand without quotes).
    bool ParseValueData(RegistryScriptValue& value) {
        Token type = Next();
        Token data = Next();
        if (failed_)
            return false;
        if (!IsName(data))
            return Fail(data.line, "expected the value's data");
        WideString text;
        if (!Expand(data, text))
            return false;
        if (EqualsKeyword(type, "S")) {
            value.type = RegistryValueType::String;
            value.text = std::move(text);
            return true;
        }
        if (EqualsKeyword(type, "D")) {
            value.type = RegistryValueType::Dword;
            if (!ParseNumber(text, value.number))
                return Fail(data.line, "a 'd' value must be a 32-bit decimal or 0x number");
            return true;
        }
        return Fail(type.line, "expected the value type 's' or 'd'");
    }

    static bool ParseNumber(const WideString& text, uint32_t& number) noexcept {
        size_t index = 0;
        uint32_t base = 10;
        if (text.size() > 2 && text[0] == '0' && (text[1] == 'x' || text[1] == 'X')) {
            base = 16;
            index = 2;
        }
        if (index >= text.size())
            return false;
        uint64_t result = 0;
        for (; index < text.size(); ++index) {
            const WideChar c = AsciiUpper(text[index]);
            uint32_t digit;
            if (c >= '0' && c <= '9')
                digit = static_cast<uint32_t>(c - '0');
            else if (base == 16 && c >= 'A' && c <= 'F')
                digit = static_cast<uint32_t>(c - 'A' + 10);
            else
                return false;
            result = result * base + digit;
            if (result > 0xFFFFFFFFu)
                return false;
        }
        number = static_cast<uint32_t>(result);
        return true;
    }

    // Braces and '=' are structure only when they stand alone; "{GUID}" is a name.
    static bool IsName(const Token& token) noexcept {
        if (token.kind == Token::Kind::Quoted)
            return true;
        return token.kind == Token::Kind::Word && !IsPunctuation(token, '{') &&
               !IsPunctuation(token, '}') && !IsPunctuation(token, '=');
    }

    // Replaces %NAME% placeholders; "%%" stands for one percent sign.
    bool Expand(const Token& token, WideString& out) {
        out.clear();
        const WideString& text = token.text;
        for (size_t index = 0; index < text.size(); ++index) {
            if (text[index] != '%') {
                out.push_back(text[index]);
                continue;
            }
            const size_t close = text.find('%', index + 1);
            if (close == WideString::npos)
                return Fail(token.line, "a '%' placeholder is not closed");
            const WideStringView name(text.data() + index + 1, close - index - 1);
            if (name.empty()) {
                out.push_back('%');
            } else {
                const RegistryScriptReplacement* found = nullptr;
                for (const RegistryScriptReplacement& replacement : replacements_) {
                    if (WideStringView(replacement.name) == name)
                        found = &replacement;
                }
                if (!found)
                    return Fail(token.line, "unknown placeholder");
                out += found->value;
            }
            index = close;
        }
        return true;
    }

    static bool RootFromToken(const Token& token, RegistryRoot& root) noexcept {
        struct Name {
            const char* shortName;
            const char* longName;
            RegistryRoot root;
        };
        static const Name names[] = {
            {"HKCR", "HKEY_CLASSES_ROOT", RegistryRoot::ClassesRoot},
            {"HKCU", "HKEY_CURRENT_USER", RegistryRoot::CurrentUser},
            {"HKLM", "HKEY_LOCAL_MACHINE", RegistryRoot::LocalMachine},
            {"HKU", "HKEY_USERS", RegistryRoot::Users},
            {"HKCC", "HKEY_CURRENT_CONFIG", RegistryRoot::CurrentConfig},
        };
        for (const Name& name : names) {
            if (EqualsKeyword(token, name.shortName) || EqualsKeyword(token, name.longName)) {
                root = name.root;
                return true;
            }
        }
        return false;
    }

    void Push(Token token) {
        pushedBack_ = std::move(token);
        hasPushedBack_ = true;
    }

    Token Next() {
        if (hasPushedBack_) {
            hasPushedBack_ = false;
            return std::move(pushedBack_);
        }
        while (position_ < script_.size() && IsSpace(script_[position_])) {
            if (script_[position_] == '\n')
                ++line_;
            ++position_;
        }
        Token token;
        token.line = line_;
        if (position_ >= script_.size())
            return token;
        if (script_[position_] == '\'') {
            // A quoted text; two quotes in a row stand for one.
            token.kind = Token::Kind::Quoted;
            ++position_;
            for (;;) {
                if (position_ >= script_.size()) {
                    Fail(token.line, "a quoted text is not closed");
                    return Token{};
                }
                const WideChar c = script_[position_++];
                if (c == '\n')
                    ++line_;
                if (c == '\'') {
                    if (position_ < script_.size() && script_[position_] == '\'') {
                        ++position_;
                    } else {
                        return token;
                    }
                }
                token.text.push_back(c);
            }
        }
        token.kind = Token::Kind::Word;
        while (position_ < script_.size() && !IsSpace(script_[position_]) &&
               script_[position_] != '\'')
            token.text.push_back(script_[position_++]);
        return token;
    }

    bool Fail(size_t line, const char* message) {
        if (!failed_) {
            failed_ = true;
            error_.line = line;
            error_.message = message;
        }
        return false;
    }

    WideStringView script_;
    const std::vector<RegistryScriptReplacement>& replacements_;
    std::vector<RegistryKeyOperation>& operations_;
    RegistryScriptError& error_;
    size_t position_ = 0;
    size_t line_ = 1;
    bool failed_ = false;
    Token pushedBack_;
    bool hasPushedBack_ = false;
};

// Resource compilers may pad a script with zeros; a zero inside the text is not padding.
bool OnlyZerosFrom(const uint8_t* bytes, size_t index, size_t count) noexcept {
    for (; index < count; ++index) {
        if (bytes[index] != 0)
            return false;
    }
    return true;
}

}  // namespace

bool ParseRegistryScript(WideStringView script,
                         const std::vector<RegistryScriptReplacement>& replacements,
                         std::vector<RegistryKeyOperation>& operations,
                         RegistryScriptError& error) {
    operations.clear();
    error = RegistryScriptError{};
    Parser parser(script, replacements, operations, error);
    if (parser.ParseScript())
        return true;
    operations.clear();
    return false;
}

bool DecodeRegistryScriptBytes(const uint8_t* bytes, size_t count, WideString& text) {
    text.clear();
    if (count >= 2 && bytes[0] == 0xFF && bytes[1] == 0xFE) {
        if (count % 2 != 0)
            return false;
        text.reserve((count - 2) / 2);
        for (size_t index = 2; index < count; index += 2) {
            const WideChar unit = static_cast<WideChar>(bytes[index] | (bytes[index + 1] << 8));
            if (unit == 0)
                return OnlyZerosFrom(bytes, index, count) || (text.clear(), false);
            text.push_back(unit);
        }
        return true;
    }
    text.reserve(count);
    for (size_t index = 0; index < count; ++index) {
        if (bytes[index] == 0)
            return OnlyZerosFrom(bytes, index, count) || (text.clear(), false);
        if (bytes[index] > 0x7F) {
            text.clear();
            return false;
        }
        text.push_back(static_cast<WideChar>(bytes[index]));
    }
    return true;
}
