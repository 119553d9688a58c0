// The orders of stream calls that lvconsume can take a station's file in, each one way that a
// consumer such as Explorer reads a virtual file.
#pragma once

#include "tools/lvconsume/stream_checks.h"

enum class Order { kStatSeekRead, kSeekCopyTo, kReadOnly, kCopyToHalves, kStatAfter };

struct NamedOrder {
    const wchar_t* name;
    Order order;
};

// The order of that command-line name; null when there is none.
const NamedOrder* FindOrder(const wchar_t* name) noexcept;

// Runs the order's calls from the stream's start; false with the failure recorded.
[[nodiscard]] bool RunOrder(Order order, StreamChecks& stream);
