// Why a station's port did not open, and the message that tells the user which case it is.
#pragma once

#include <vector>

#include "support/portable/wide_text.h"

// The three cases a user acts on differently: plug in or choose another port, close the other
// program, or read what the system says.
enum class PortOpenFailure {
    NotPresent,  // the computer does not list the port now, or the system finds no such device
    InUse,       // another handle holds it
    Other,       // anything else, in the system's words
};

struct PortOpenProblem {
    PortOpenFailure failure = PortOpenFailure::Other;
    WideString port;                  // as the station names it ("\\.\" is taken off for display)
    std::vector<WideString> present;  // the ports the computer lists now, in its order
    WideString systemText;            // the system's text of the failure
};

// The string table's texts the message is made of.
struct PortProblemTexts {
    WideString notPresent;      // two %s: the port, the list of present ports
    WideString noPortsPresent;  // one %s: the port
    WideString inUse;
};

// Whether the computer's list holds the port; device names ignore letter case, as does
// "\\.\" in front of the port.
[[nodiscard]] bool IsPortListed(WideStringView port, const std::vector<WideString>& present);

// The port's name as the user knows it: without the device namespace prefix.
[[nodiscard]] WideStringView PortDisplayName(WideStringView port) noexcept;

// The message for the problem. Other without a system text falls back to the in-use text, the
// message this driver always gave.
[[nodiscard]] WideString PortOpenProblemText(const PortOpenProblem& problem,
                                             const PortProblemTexts& texts);
