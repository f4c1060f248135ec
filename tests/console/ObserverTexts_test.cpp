#include "console/ObserverTexts.h"

#include <gtest/gtest.h>

#include <string>

namespace vx7diag {
namespace {

struct TextCase {
    const char* table;
    unsigned int index;
    std::string golden;
};

class ObserverTextsTest : public ::testing::TestWithParam<TextCase> {};

const std::string& Lookup(const std::string& table, unsigned int index) {
    if (table == "call")
        return g_CallStateStr[index];
    if (table == "chan")
        return g_ChanStateStr[index];
    if (table == "reason")
        return g_ReasonStr[index];
    if (table == "line")
        return g_LineStateStr[index];
    return g_LineStateReasonStr[index];
}

TEST_P(ObserverTextsTest, TextIsPaddedToWipeALongerOne) {
    EXPECT_EQ(Lookup(GetParam().table, GetParam().index), GetParam().golden);
}

// Golden texts with their blanks written out: 21 characters for call states, 26 for
// channel states and reasons, 16 and 14 for the line state and its reason.
INSTANTIATE_TEST_SUITE_P(Tables, ObserverTextsTest,
                         ::testing::Values(TextCase{"call", 0, "Null                 "},
                                           TextCase{"call", 2, "Connected            "},
                                           TextCase{"call", 11, "Offered              "},
                                           TextCase{"call", 17, "Alerting             "},
                                           TextCase{"call", 18, "IncomingProceeding   "},
                                           TextCase{"call", 21, "DialTone             "},
                                           TextCase{"chan", 0, "                          "},
                                           TextCase{"chan", 1, "Active\t\t           "},
                                           TextCase{"chan", 2, "ActivePending             "},
                                           TextCase{"chan", 13, "OutOfServiceMediaDetached "},
                                           TextCase{"chan", 14, "OutOfServiceRemote        "},
                                           TextCase{"reason", 0, "                          "},
                                           TextCase{"reason", 14, "Normal                    "},
                                           TextCase{"reason", 38, "FacilityNotSubscribed     "},
                                           TextCase{"reason", 51, "NoRingback                "},
                                           TextCase{"line", 0, "InService       "},
                                           TextCase{"line", 1, "Out of Service  "},
                                           TextCase{"linereason", 0, "Null          "},
                                           TextCase{"linereason", 5, "Alarm         "}));

struct UnknownCase {
    const char* (*text)(unsigned int);
    unsigned int value;
    std::string golden;
};

class UnknownValueTest : public ::testing::TestWithParam<UnknownCase> {};

TEST_P(UnknownValueTest, ValuePastTheTableShowsItsNumberInTheFieldWidth) {
    EXPECT_EQ(std::string(GetParam().text(GetParam().value)), GetParam().golden);
}

INSTANTIATE_TEST_SUITE_P(
    PastTheEnd, UnknownValueTest,
    ::testing::Values(UnknownCase{ConsoleCallStateText, 22, "?22                  "},
                      UnknownCase{ConsoleChanStateText, 15, "?15                       "},
                      UnknownCase{ConsoleReasonText, 52, "?52                       "},
                      UnknownCase{ConsoleReasonText, 4294967295u, "?4294967295               "},
                      UnknownCase{ConsoleLineStateReasonText, 6, "?6            "},
                      UnknownCase{ConsoleCallStateText, 21, "DialTone             "},
                      UnknownCase{ConsoleChanStateText, 1, "Active\t\t           "}));

}  // namespace
}  // namespace vx7diag
