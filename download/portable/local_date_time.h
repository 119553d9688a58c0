// A moment in local time, as the kept files' names and the journal's rows show it.
#pragma once

struct LocalDateTime {
    int Year = 0;
    int Month = 0;
    int Day = 0;
    int Hour = 0;
    int Minute = 0;
    int Second = 0;
    int OffsetMinutes = 0;  // local minus UTC; the kept file's name leaves it out
};
