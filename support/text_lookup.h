// The lookup that every user-visible text passes through: the English string-table text,
// translated by its English wording from a translation file beside the module.
#pragma once

#include <windows.h>

#include <string>

#include "support/portable/translation_file.h"

constexpr LANGID kEnglishLanguage = MAKELANGID(LANG_ENGLISH, SUBLANG_ENGLISH_US);  // 1033

// The English text of a string-table id of the given module (LANGID 1033); empty when missing.
std::wstring LoadEnglishString(HMODULE module, UINT id);

// The text to show for a string-table id: its English text translated into targetLanguage.
std::wstring LoadText(HMODULE module, UINT id, LANGID targetLanguage);

// The text to show for an English text (translator's note included) in targetLanguage, from the
// translation file found for the module; the English text without its note when there is none.
std::wstring TranslateText(const std::wstring& english, LANGID sourceLanguage,
                           LANGID targetLanguage, HMODULE module);

// The same for a module known by its file path (tests place translation files beside a path of
// their own).
std::wstring TranslateTextForModulePath(const std::wstring& english, LANGID sourceLanguage,
                                        LANGID targetLanguage, const std::wstring& modulePath);

// The first existing file of: <dir><locale>\<base>.txt, <dir><base>.txt,
// <dir><locale>\ShellExt.txt, <dir>ShellExt.txt, built from the module's path; empty when none
// exists.
std::wstring FindTranslationFile(const std::wstring& modulePath, LANGID language);

// Reads one translation file into map. E_FAIL for a file shorter than 2 bytes or not a
// translation file; open and mapping failures give the HRESULT of their Win32 error.
[[nodiscard]] HRESULT LoadTranslationFile(const std::wstring& path, TranslationMap& map) noexcept;

// Forgets every file found and loaded, so that the next lookup searches again (tests, and a
// translator who edits a file while the process runs).
void ClearTranslationCache() noexcept;

// The language in which this thread shows its texts: the one chosen with SelectUiLanguage on
// this thread, else GetThreadUILanguage.
LANGID UiLanguage() noexcept;

// Makes language this thread's UI language only (a worker taking over its creator's language).
[[nodiscard]] bool SelectThreadUiLanguage(LANGID language) noexcept;

// Makes language this thread's UI language and, where the system offers it, the process's
// preferred UI language; also sets the C runtime locale. False when the thread's language could
// not be set.
[[nodiscard]] bool SelectUiLanguage(LANGID language) noexcept;

// The text to show for a string-table id of this module, in this thread's UI language.
std::wstring LoadUiText(UINT id);

// The text to show for an English text of this module, in this thread's UI language.
std::wstring TranslateUiText(const std::wstring& english);
