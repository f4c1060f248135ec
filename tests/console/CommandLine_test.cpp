#include "console/CommandLine.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>

namespace lineprobe {
namespace {

struct ScanCase {
    const char* name;
    std::string line;
    int fields;
    const char* word;
    int board;
    int trunk;
    int chan;
    const char* text;
};

void PrintTo(const ScanCase& c, std::ostream* os) {
    *os << c.name;
}

class ScanCommandLineTest : public ::testing::TestWithParam<ScanCase> {};

// Untouched fields keep these values, so a case can tell "not reached" from "read as 0".
constexpr int UNSET = -777;
constexpr const char* PREVIOUS_WORD = "previous";

TEST_P(ScanCommandLineTest, SplitsLikeTheScanFormat) {
    const ScanCase& c = GetParam();
    char word[MAX_BUFFER_SIZE];
    char text[MAX_BUFFER_SIZE];
    std::strcpy(word, PREVIOUS_WORD);
    std::strcpy(text, "untouched");
    int board = UNSET;
    int trunk = UNSET;
    int chan = UNSET;

    EXPECT_EQ(ScanCommandLine(c.line, word, board, trunk, chan, text), c.fields);
    EXPECT_STREQ(word, c.word);
    EXPECT_EQ(board, c.board);
    EXPECT_EQ(trunk, c.trunk);
    EXPECT_EQ(chan, c.chan);
    EXPECT_STREQ(text, c.text);
}

INSTANTIATE_TEST_SUITE_P(
    Lines, ScanCommandLineTest,
    ::testing::Values(
        ScanCase{"WordAlone", "quit", 1, "quit", UNSET, UNSET, UNSET, "untouched"},
        ScanCase{"WordAndOneNumber", "quit 1", 2, "quit", 1, UNSET, UNSET, "untouched"},
        ScanCase{"BoardAndLine", "trunk 1 2", 3, "trunk", 1, 2, UNSET, "untouched"},
        ScanCase{"BoardLineChannel", "makecall 1 1 3", 4, "makecall", 1, 1, 3, "untouched"},
        ScanCase{"WithAddress", "destaddr 2 1 7 5551234", 5, "destaddr", 2, 1, 7, "5551234"},
        ScanCase{"ExtraBlanksAndTabs", "  phone\t 3   4  5  ", 4, "phone", 3, 4, 5, "untouched"},
        ScanCase{"NegativeNumbers", "phone -1 +2 -3", 4, "phone", -1, 2, -3, "untouched"},
        ScanCase{"WordEndsTheScan", "phone x 1 2", 1, "phone", UNSET, UNSET, UNSET, "untouched"},
        ScanCase{"WordAfterOneNumberEndsIt", "phone 1 y 2", 2, "phone", 1, UNSET, UNSET,
                 "untouched"},
        ScanCase{"NumberRunsIntoText", "origaddr 1 2 3abc", 5, "origaddr", 1, 2, 3, "abc"},
        ScanCase{"DigitsThenLettersStopTheNextNumber", "phone 12ab 3", 2, "phone", 12, UNSET, UNSET,
                 "untouched"},
        ScanCase{"LoneSignIsNotANumber", "phone - 3", 1, "phone", UNSET, UNSET, UNSET, "untouched"},
        ScanCase{"DoubleSignIsNotANumber", "phone +-3", 1, "phone", UNSET, UNSET, UNSET,
                 "untouched"},
        ScanCase{"IntMaxIsANumber", "phone 2147483647 -2147483648 0", 4, "phone", 2147483647,
                 -2147483647 - 1, 0, "untouched"},
        ScanCase{"PastIntIsNotANumber", "quit 1 1 2147483648", 3, "quit", 1, 1, UNSET, "untouched"},
        ScanCase{"OnlyTheFirstTextWordIsKept", "origaddr 1 2 3 555 1212", 5, "origaddr", 1, 2, 3,
                 "555"},
        ScanCase{"EmptyLineKeepsPreviousWord", "", -1, PREVIOUS_WORD, UNSET, UNSET, UNSET,
                 "untouched"},
        ScanCase{"BlankLineKeepsPreviousWord", " \t  ", -1, PREVIOUS_WORD, UNSET, UNSET, UNSET,
                 "untouched"}),
    [](const ::testing::TestParamInfo<ScanCase>& info) { return std::string(info.param.name); });

TEST(ScanCommandLine, LongWordIsCutAndItsRestDropped) {
    // 300 letters and then a number: the number must still be the second field, so the
    // cut-off rest of the word may not be taken for a field of its own.
    const std::string line = std::string(300, 'w') + " 42";
    struct {
        char word[MAX_BUFFER_SIZE];
        char canary[8];
    } guarded;
    std::memset(&guarded, '#', sizeof guarded);
    char text[MAX_BUFFER_SIZE];
    int board = UNSET;
    int trunk = UNSET;
    int chan = UNSET;

    EXPECT_EQ(ScanCommandLine(line, guarded.word, board, trunk, chan, text), 2);
    EXPECT_EQ(std::string(guarded.word), std::string(255, 'w'));
    EXPECT_EQ(board, 42);
    EXPECT_EQ(std::string(guarded.canary, sizeof guarded.canary), "########");
}

TEST(ScanCommandLine, LongTextIsCutToTheBuffer) {
    const std::string address(1000, '5');
    char word[MAX_BUFFER_SIZE];
    char text[MAX_BUFFER_SIZE];
    int board = UNSET;
    int trunk = UNSET;
    int chan = UNSET;

    EXPECT_EQ(ScanCommandLine("destaddr 1 1 1 " + address, word, board, trunk, chan, text), 5);
    EXPECT_EQ(std::string(text), std::string(255, '5'));
}

}  // namespace
}  // namespace lineprobe
