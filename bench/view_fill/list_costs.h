// What a list control costs in this process without the view: the same inserts and text
// requests on a bare list, plain and subclassed as the view's list is, and one call that Wine
// answers in its server.
#pragma once

#include <windows.h>

// For comparison with the view: the view's inserts and text requests on a bare list control, once
// plain and once subclassed with SetWindowSubclass as the view's list is. Its parent answers every
// text and image at once, so what is left is the control and the subclass.
struct BareList {
    double inserts = 0;
    double texts = 0;
};

BareList MeasureBareList(int itemCount, bool subclassed, bool visible, bool details);

// One call that Wine answers in its server (a window property lookup, as the comctl32 subclass
// makes on every message), in microseconds: on this kind of machine it flips between two speeds
// from one run to the next, and most per-item figures follow it.
double ServerRoundTripMicroseconds(HWND window);
