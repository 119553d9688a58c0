// The mark of a shell object whose class is not part of the module yet: the folder framework
// answers requests for such a class with E_NOINTERFACE instead of creating it.
#pragma once

#include <type_traits>

struct PendingShellObject {};

template <typename T>
inline constexpr bool kIsPendingShellObject = std::is_base_of_v<PendingShellObject, T>;
