// Parser of the translation files: encoding, lines, pairs and escapes.
#include "support/portable/translation_file.h"

namespace {

constexpr WideChar kReplacement = 0xFFFD;

void ReplaceAll(WideString& text, WideStringView from, WideChar to) {
    WideString result;
    result.reserve(text.size());
    size_t start = 0;
    for (;;) {
        const size_t found = text.find(from, start);
        if (found == WideString::npos)
            break;
        result.append(text, start, found - start);
        result.push_back(to);
        start = found + from.size();
    }
    result.append(text, start, WideString::npos);
    text.swap(result);
}

void AppendCodePoint(WideString& text, uint32_t codePoint) {
    if (codePoint < 0x10000) {
        text.push_back(static_cast<WideChar>(codePoint));
        return;
    }
    codePoint -= 0x10000;
    text.push_back(static_cast<WideChar>(0xD800 + (codePoint >> 10)));
    text.push_back(static_cast<WideChar>(0xDC00 + (codePoint & 0x3FF)));
}

// Strict UTF-8 (no overlong forms, no surrogates); every bad sequence becomes one U+FFFD.
void DecodeUtf8(const uint8_t* bytes, size_t size, WideString& text) {
    text.reserve(size);
    size_t index = 0;
    while (index < size) {
        const uint8_t lead = bytes[index];
        if (lead < 0x80) {
            text.push_back(lead);
            ++index;
            continue;
        }
        size_t length = 0;
        uint32_t codePoint = 0;
        uint32_t minimum = 0;
        if ((lead & 0xE0) == 0xC0) {
            length = 2, codePoint = lead & 0x1F, minimum = 0x80;
        } else if ((lead & 0xF0) == 0xE0) {
            length = 3, codePoint = lead & 0x0F, minimum = 0x800;
        } else if ((lead & 0xF8) == 0xF0) {
            length = 4, codePoint = lead & 0x07, minimum = 0x10000;
        }
        size_t taken = 1;
        while (length != 0 && taken < length && index + taken < size &&
               (bytes[index + taken] & 0xC0) == 0x80) {
            codePoint = (codePoint << 6) | (bytes[index + taken] & 0x3F);
            ++taken;
        }
        if (length == 0 || taken != length || codePoint < minimum || codePoint > 0x10FFFF ||
            (codePoint >= 0xD800 && codePoint <= 0xDFFF)) {
            text.push_back(kReplacement);
        } else {
            AppendCodePoint(text, codePoint);
        }
        index += taken;
    }
}

bool IsBlank(WideStringView line) {
    return line.find_first_not_of(WIDE_TEXT(" \t")) == WideStringView::npos;
}

}  // namespace

WideString DecodeTranslationEscapes(WideStringView text) {
    WideString decoded(text);
    if (decoded.find(WideChar('\\')) == WideString::npos)
        return decoded;
    ReplaceAll(decoded, WIDE_TEXT("\\n"), WideChar('\n'));
    ReplaceAll(decoded, WIDE_TEXT("\\t"), WideChar('\t'));
    ReplaceAll(decoded, WIDE_TEXT("\\r"), WideChar('\r'));
    ReplaceAll(decoded, WIDE_TEXT("\\\\"), WideChar('\\'));
    return decoded;
}

bool DecodeTranslationFileText(const uint8_t* bytes, size_t size, WideString& text) noexcept try {
    text.clear();
    if (bytes == nullptr || size < 2)
        return false;
    if (bytes[0] == 0xFE && bytes[1] == 0xFF)
        return false;  // big-endian: no editor a translator uses writes it by default
    const bool marked = bytes[0] == 0xFF && bytes[1] == 0xFE;
    if (marked || (bytes[1] == 0 && bytes[0] != 0)) {
        // A trailing odd byte is half a character: it is dropped.
        const size_t begin = marked ? 2 : 0;
        text.reserve((size - begin) / 2);
        for (size_t index = begin; index + 1 < size; index += 2)
            text.push_back(static_cast<WideChar>(bytes[index] | (bytes[index + 1] << 8)));
        return true;
    }
    if (size >= 3 && bytes[0] == 0xEF && bytes[1] == 0xBB && bytes[2] == 0xBF)
        DecodeUtf8(bytes + 3, size - 3, text);
    else
        DecodeUtf8(bytes, size, text);
    return true;
} catch (...) {
    text.clear();  // out of memory: no text rather than part of one
    return false;
}

bool ParseTranslationFile(const uint8_t* bytes, size_t size, TranslationMap& map) noexcept try {
    WideString text;
    if (!DecodeTranslationFileText(bytes, size, text))
        return false;

    TranslationMap parsed;
    WideString pendingEnglish;
    bool englishPending = false;
    size_t start = 0;
    while (start < text.size()) {
        size_t end = text.find_first_of(WIDE_TEXT("\r\n"), start);
        if (end == WideString::npos)
            end = text.size();
        const WideStringView line(text.data() + start, end - start);
        // CR LF, LF and a lone CR all end a line.
        start = end;
        if (start < text.size() && text[start] == '\r')
            ++start;
        if (start < text.size() && text[start] == '\n')
            ++start;

        if (IsBlank(line)) {
            englishPending = false;
            continue;
        }
        if (line.front() != '[')
            continue;  // a comment: keeps a waiting English line waiting
        const size_t close = line.rfind(']');
        if (close == 0 || close == WideStringView::npos) {
            englishPending = false;
            continue;
        }
        WideString entry = DecodeTranslationEscapes(line.substr(1, close - 1));
        if (!englishPending) {
            pendingEnglish.swap(entry);
            englishPending = true;
            continue;
        }
        englishPending = false;
        if (!pendingEnglish.empty())
            parsed.emplace(std::move(pendingEnglish), std::move(entry));
        pendingEnglish.clear();
    }
    // The caller's map changes only when the whole file was read.
    map.merge(parsed);
    return true;
} catch (...) {
    return false;  // out of memory
}
