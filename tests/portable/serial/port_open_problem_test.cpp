// The message of a port that did not open: each case, the list of present ports, the port's name.
#include <gtest/gtest.h>

#include "download/portable/port_open_problem.h"

namespace {

const PortProblemTexts kTexts = {WIDE_TEXT("%s gone; present: %s."), WIDE_TEXT("%s gone; none."),
                                 WIDE_TEXT("in use")};

TEST(PortOpenProblem, EachCaseHasItsText) {
    const struct {
        PortOpenFailure failure;
        WideString port;
        std::vector<WideString> present;
        WideString systemText;
        WideString text;
    } cases[] = {
        {PortOpenFailure::NotPresent, WIDE_TEXT("\\\\.\\COM5"), {WIDE_TEXT("COM3"), WIDE_TEXT("COM7")},
         WIDE_TEXT("unused"), WIDE_TEXT("COM5 gone; present: COM3, COM7.")},
        {PortOpenFailure::NotPresent, WIDE_TEXT("COM5"), {WIDE_TEXT("COM3")}, {},
         WIDE_TEXT("COM5 gone; present: COM3.")},
        {PortOpenFailure::NotPresent, WIDE_TEXT("COM5"), {}, {}, WIDE_TEXT("COM5 gone; none.")},
        {PortOpenFailure::InUse, WIDE_TEXT("COM5"), {WIDE_TEXT("COM5")}, WIDE_TEXT("denied"),
         WIDE_TEXT("in use")},
        {PortOpenFailure::Other, WIDE_TEXT("COM5"), {}, WIDE_TEXT("The device is not ready."),
         WIDE_TEXT("The device is not ready.")},
        {PortOpenFailure::Other, WIDE_TEXT("COM5"), {}, {}, WIDE_TEXT("in use")},
    };
    for (const auto& test : cases) {
        const PortOpenProblem problem{test.failure, test.port, test.present, test.systemText};
        EXPECT_TRUE(test.text == PortOpenProblemText(problem, kTexts))
            << static_cast<int>(test.failure) << " with " << test.present.size() << " port(s)";
    }
}

TEST(PortOpenProblem, APortIsListedWhateverItsLetterCaseAndDevicePrefix) {
    const std::vector<WideString> present = {WIDE_TEXT("COM3"), WIDE_TEXT("com12")};
    const struct {
        WideString port;
        bool listed;
    } cases[] = {
        {WIDE_TEXT("COM3"), true},       {WIDE_TEXT("cOm3"), true},
        {WIDE_TEXT("\\\\.\\COM12"), true}, {WIDE_TEXT("COM1"), false},
        {WIDE_TEXT("COM123"), false},    {WIDE_TEXT("\\\\.\\"), false},
        {WideString(), false},
    };
    for (const auto& test : cases)
        EXPECT_EQ(test.listed, IsPortListed(test.port, present)) << test.port.size();
}

}  // namespace
