// Times the station store's operations on bases of 10, 100 and 1,000 stations, each in a scratch
// registry key, and prints per-operation times and how they grow from 100 to 1,000 stations; then
// a paste of 1,000 stations into 1,000 and the listing of 3,000 (the store's and lvstations').
#include <windows.h>
#include <objbase.h>

#include <chrono>
#include <cstdio>
#include <string>
#include <vector>

#include "stations/station_store.h"
#include "support/registry_value.h"  // DeleteKeyRecursive
#include "support/unique_resource.h"
#include "tools/lvstations/station_list_command.h"

namespace {

using Clock = std::chrono::steady_clock;

struct Figures {
    double addMicroseconds;
    double findMicroseconds;
    double enumerateMicroseconds;  // one whole listing, as the folder makes it
    double uniqueNameMicroseconds;
};

double MicrosecondsSince(Clock::time_point start) {
    return std::chrono::duration<double, std::micro>(Clock::now() - start).count();
}

Figures Measure(int stationCount) {
    // Stations named like the folder's own additions: "New digital level", " (2)", " (3)", …
    const std::wstring base = L"New digital level";
    std::vector<Station> stations;
    for (int i = 1; i <= stationCount; ++i) {
        Station station = DefaultStation();
        station.Name = i == 1 ? base : base + L" (" + std::to_wstring(i) + L")";
        stations.push_back(station);
    }

    Figures figures{};
    auto start = Clock::now();
    for (const Station& station : stations) {
        if (const HRESULT added = AddStation(station); FAILED(added))
            fprintf(stderr, "add failed: 0x%08lX\n", static_cast<unsigned long>(added));
    }
    figures.addMicroseconds = MicrosecondsSince(start) / stationCount;

    start = Clock::now();
    for (const Station& station : stations) {
        Station found;
        found.Name = station.Name;
        if (const HRESULT result = FindStation(found); FAILED(result))
            fprintf(stderr, "find failed: 0x%08lX\n", static_cast<unsigned long>(result));
    }
    figures.findMicroseconds = MicrosecondsSince(start) / stationCount;

    const int rounds = 5;
    start = Clock::now();
    for (int round = 0; round < rounds; ++round) {
        if (ListStationNames().size() != static_cast<size_t>(stationCount)) {
            fprintf(stderr, "enumeration lost stations\n");
        }
    }
    figures.enumerateMicroseconds = MicrosecondsSince(start) / rounds;

    // Every candidate up to the count is taken, so the name search walks the whole base.
    start = Clock::now();
    const std::wstring unique = MakeUniqueStationName(base);
    figures.uniqueNameMicroseconds = MicrosecondsSince(start);
    if (unique != base + L" (" + std::to_wstring(stationCount + 1) + L")") {
        fprintf(stderr, "unexpected unique name\n");
    }
    return figures;
}

// Runs measure in an empty store of its own under HKEY_CURRENT_USER\scratch; false when the
// store could not be redirected.
template <typename Measure>
bool InScratchStore(const wchar_t* scratch, Measure&& measure) {
    UniqueRegKey root;
    ::RegCreateKeyExW(HKEY_CURRENT_USER, scratch, 0, nullptr, 0, KEY_ALL_ACCESS, nullptr,
                      root.put(), nullptr);
    if (::RegOverridePredefKey(HKEY_CURRENT_USER, root.get()) != ERROR_SUCCESS)
        return false;
    measure();
    ::RegOverridePredefKey(HKEY_CURRENT_USER, nullptr);
    root.reset();
    // A scratch key left behind is only clutter in the benchmark's own redirected hive.
    (void)DeleteKeyRecursive(HKEY_CURRENT_USER, scratch);
    return true;
}

std::vector<Station> Levels(int count) {
    std::vector<Station> stations;
    for (int i = 1; i <= count; ++i) {
        Station station = DefaultStation();
        station.Name = L"Level " + std::to_wstring(i);
        stations.push_back(station);
    }
    return stations;
}

// The paste of 1,000 stations that all exist already, as the view's Paste command stores them:
// one reading of the names, the "Copy of " names, one batch of writes.
void MeasurePaste() {
    const std::vector<Station> stored = Levels(1000);
    if (const HRESULT added = AddStations(stored); FAILED(added))
        fprintf(stderr, "add failed: 0x%08lX\n", static_cast<unsigned long>(added));
    const auto start = Clock::now();
    const PasteOutcome outcome = AddPastedStations(stored, L"Copy of ");
    const double milliseconds = MicrosecondsSince(start) / 1000;
    if (FAILED(outcome.result) || ListStationNames().size() != 2000)
        fprintf(stderr, "paste failed: 0x%08lX\n", static_cast<unsigned long>(outcome.result));
    printf("paste of 1,000 stations into 1,000 (read, name, write): %.0f ms\n", milliseconds);
}

void MeasureListing() {
    if (const HRESULT added = AddStations(Levels(3000)); FAILED(added))
        fprintf(stderr, "add failed: 0x%08lX\n", static_cast<unsigned long>(added));
    auto start = Clock::now();
    const size_t names = ListStationNames().size();
    const double namesMilliseconds = MicrosecondsSince(start) / 1000;
    start = Clock::now();
    const size_t stations = ListStations().size();
    const double stationsMilliseconds = MicrosecondsSince(start) / 1000;
    size_t lines = 0;
    start = Clock::now();
    (void)ListStationsCommand([&](const std::wstring&) { ++lines; });
    const double commandMilliseconds = MicrosecondsSince(start) / 1000;
    if (names != 3000 || stations != 3000 || lines != 6000)
        fprintf(stderr, "listing lost stations\n");
    printf(
        "3,000 stations: ListStationNames %.0f ms, ListStations %.0f ms, lvstations list "
        "(without the console) %.0f ms\n",
        namesMilliseconds, stationsMilliseconds, commandMilliseconds);
}

}  // namespace

int main() {
    if (FAILED(::CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED)))
        return 1;
    const wchar_t scratch[] = L"Software\\LVShellExt Benchmark";
    printf("%-9s %12s %12s %14s %18s\n", "stations", "add (us)", "find (us)", "enumerate (us)",
           "unique name (us)");
    std::vector<Figures> results;
    for (int count : {10, 100, 1000}) {
        UniqueRegKey root;
        ::RegCreateKeyExW(HKEY_CURRENT_USER, scratch, 0, nullptr, 0, KEY_ALL_ACCESS, nullptr,
                          root.put(), nullptr);
        // Each size starts from an empty store of its own.
        if (::RegOverridePredefKey(HKEY_CURRENT_USER, root.get()) != ERROR_SUCCESS)
            return 1;
        const Figures figures = Measure(count);
        ::RegOverridePredefKey(HKEY_CURRENT_USER, nullptr);
        root.reset();
        // A scratch key left behind is only clutter in the benchmark's own redirected hive.
        (void)DeleteKeyRecursive(HKEY_CURRENT_USER, scratch);
        printf("%-9d %12.1f %12.1f %14.1f %18.1f\n", count, figures.addMicroseconds,
               figures.findMicroseconds, figures.enumerateMicroseconds,
               figures.uniqueNameMicroseconds);
        results.push_back(figures);
    }
    const Figures& hundred = results[1];
    const Figures& thousand = results[2];
    printf(
        "growth from 100 to 1,000 stations (per operation): add x%.1f, find x%.1f, enumerate "
        "x%.1f, unique name x%.1f\n",
        thousand.addMicroseconds / hundred.addMicroseconds,
        thousand.findMicroseconds / hundred.findMicroseconds,
        thousand.enumerateMicroseconds / hundred.enumerateMicroseconds,
        thousand.uniqueNameMicroseconds / hundred.uniqueNameMicroseconds);
    if (!InScratchStore(scratch, MeasurePaste) || !InScratchStore(scratch, MeasureListing))
        return 1;
    ::CoUninitialize();
    return 0;
}
