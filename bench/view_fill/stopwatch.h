// The benchmark's clock: the performance counter, read as milliseconds since a start.
#pragma once

#include <windows.h>

inline LONGLONG Ticks() {
    LARGE_INTEGER now{};
    ::QueryPerformanceCounter(&now);
    return now.QuadPart;
}

inline double MillisecondsSince(LONGLONG start) {
    static const LONGLONG frequency = [] {
        LARGE_INTEGER value{};
        ::QueryPerformanceFrequency(&value);
        return value.QuadPart;
    }();
    return static_cast<double>(Ticks() - start) * 1000.0 / static_cast<double>(frequency);
}
