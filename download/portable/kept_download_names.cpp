// Kept downloads without I/O: safe folder names, kept file names, retention.
#include "download/portable/kept_download_names.h"

#include "support/portable/windows_file_names.h"

#include <algorithm>
#include <cstdio>
#include <map>

namespace {

constexpr int64_t kSecondsPerDay = 24 * 60 * 60;
constexpr uint64_t kBytesPerMegabyte = 1024 * 1024;
constexpr WideChar kReplacement = WIDE_TEXT('_');

bool IsHighSurrogate(WideChar c) noexcept { return c >= 0xD800 && c <= 0xDBFF; }

void TrimTrailingDotsAndSpaces(WideString& name) {
    while (!name.empty() && (name.back() == WIDE_TEXT('.') || name.back() == WIDE_TEXT(' ')))
        name.pop_back();
}

WideString AsciiToWide(const char* text) {
    WideString wide;
    for (; *text; ++text)
        wide.push_back(static_cast<WideChar>(static_cast<unsigned char>(*text)));
    return wide;
}

}  // namespace

WideString SafeFolderName(WideStringView stationName) {
    WideString name;
    for (const WideChar c : stationName)
        name.push_back(IsForbiddenInFileName(c) ? kReplacement : c);
    // Leading spaces are legal but make a folder that Explorer lists out of place.
    const size_t first = name.find_first_not_of(WIDE_TEXT(' '));
    name.erase(0, first == WideString::npos ? name.size() : first);
    if (name.size() > kKeptFolderNameLimit) {
        size_t length = kKeptFolderNameLimit;
        if (IsHighSurrogate(name[length - 1]))
            --length;
        name.resize(length);
    }
    TrimTrailingDotsAndSpaces(name);
    if (!DeviceInFileName(name).empty()) {
        name.insert(name.begin(), kReplacement);
        if (name.size() > kKeptFolderNameLimit)
            name.resize(kKeptFolderNameLimit);  // a device name is short: only its extension goes
        TrimTrailingDotsAndSpaces(name);
    }
    return name.empty() ? WideString(1, kReplacement) : name;
}

WideString KeptFileName(const LocalDateTime& time, WideStringView extension, unsigned sequence) {
    char text[64];
    std::snprintf(text, sizeof text, "%04d-%02d-%02d %02d%02d%02d", time.Year, time.Month,
                  time.Day, time.Hour, time.Minute, time.Second);
    WideString name = AsciiToWide(text);
    if (sequence > 1) {
        std::snprintf(text, sizeof text, " (%u)", sequence);
        name += AsciiToWide(text);
    }
    name += extension;
    return name;
}

std::vector<size_t> FilesToDelete(const std::vector<KeptFile>& files, RetentionLimits limits,
                                  int64_t now) {
    std::vector<size_t> doomed;
    if (limits.Days == 0)
        return doomed;
    // The newest of each station, the later one in the list on a tie.
    std::map<WideString, size_t> newest;
    for (size_t index = 0; index < files.size(); ++index) {
        auto [place, added] = newest.try_emplace(files[index].Station, index);
        if (!added && files[index].Time >= files[place->second].Time)
            place->second = index;
    }
    std::vector<bool> protectedFile(files.size(), false);
    for (const auto& entry : newest)
        protectedFile[entry.second] = true;

    std::vector<bool> deleted(files.size(), false);
    const int64_t oldestKept = now - static_cast<int64_t>(limits.Days) * kSecondsPerDay;
    uint64_t total = 0;
    std::vector<size_t> candidates;
    for (size_t index = 0; index < files.size(); ++index) {
        if (!protectedFile[index] && files[index].Time < oldestKept) {
            deleted[index] = true;
            continue;
        }
        total += files[index].Size;
        if (!protectedFile[index])
            candidates.push_back(index);
    }
    std::stable_sort(candidates.begin(), candidates.end(),
                     [&](size_t a, size_t b) { return files[a].Time < files[b].Time; });
    const uint64_t limit = static_cast<uint64_t>(limits.Megabytes) * kBytesPerMegabyte;
    for (const size_t index : candidates) {
        if (total <= limit)
            break;
        deleted[index] = true;
        total -= files[index].Size;
    }
    for (size_t index = 0; index < files.size(); ++index) {
        if (deleted[index])
            doomed.push_back(index);
    }
    return doomed;
}
