// The prompt as the operator meets it: lookup, field counts, the result row, and input
// that is too long or not text at all.
#include <gtest/gtest.h>

#include <string>
#include <utility>

#include "ConsoleScreen.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

std::size_t CountLines(const std::string& text, const std::string& line) {
    std::size_t count = 0;
    std::size_t start = 0;
    while (start < text.size()) {
        const std::size_t end = text.find('\n', start);
        if (text.compare(start, end - start, line) == 0 && end - start == line.size()) {
            ++count;
        }
        if (end == std::string::npos) {
            break;
        }
        start = end + 1;
    }
    return count;
}

class PromptTest : public ::testing::Test {
  protected:
    void SetUp() override {
        ASSERT_TRUE(session_.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session_.Dump();
    }

    // Types a line and waits until the processor has looked its word up `times` times in all.
    void Enter(const std::string& line, const std::string& word, std::size_t times = 1) {
        session_.TypeLine(line);
        const std::string trace = "Calling CmdProcessor::FindCommand: cmdStr= " + word;
        ASSERT_TRUE(WaitForLookups(trace, times)) << "no lookup of '" << word << "'\n"
                                                  << session_.Dump();
        // The lookup is traced before the prompt comes back; wait for it as well.
        ASSERT_TRUE(session_.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW)) << session_.Dump();
    }

    bool WaitForLookups(const std::string& trace, std::size_t times) {
        for (int i = 0; i < 750; ++i) {
            const std::optional<std::string> log = session_.ReadLog();
            if (log && CountLines(*log, trace) >= times) {
                return true;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        return false;
    }

    std::string ResultRow() { return session_.Row(RESULT_ROW); }

    TerminalSession session_;
};

// One session through the lookup rules: the first line empty, unknown and wrongly cased
// words, quit with a field count it has no overload for, and empty lines, which look the last
// word up again but call nothing.
TEST_F(PromptTest, LookupFieldCountsAndTheResultRow) {
    Enter("", "");
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session_.Dump();
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: -1"));

    Enter("bogus 1 2 3", "bogus");
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 4"));
    // The next line wipes the result row; words are case-sensitive.
    std::size_t quits = 0;
    for (const char* word : {"QUIT", "Quit", "Help"}) {
        Enter("quit 7", "quit", ++quits);
        EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "")) << session_.Dump();
        Enter(word, word);
        EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << word << "\n"
                                                                              << session_.Dump();
    }
    // Quit ends nothing with a field count it has no overload for.
    for (const char* line : {"quit 1 2", "quit 1 2 3 now", "quit 1 1 99999999999"}) {
        Enter(line, "quit", ++quits);
        EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "")) << line << "\n" << session_.Dump();
    }
    Enter("", "quit", ++quits);
    Enter("   ", "quit", ++quits);
    EXPECT_EQ(ResultRow().find_first_not_of(' '), std::string::npos) << session_.Dump();
    EXPECT_EQ(session_.ReadLog()->find("terninating"), std::string::npos);
    EXPECT_TRUE(session_.StillRunning());
}

TEST_F(PromptTest, LineOfAThousandCharactersIsCutSafely) {
    const std::string line(1000, 'x');
    Enter(line, std::string(255, 'x'));
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session_.Dump();
    // Echo stays on the prompt row: nothing spills onto the rows below.
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW + 1, "")) << session_.Dump();
    EXPECT_TRUE(session_.StillRunning());

    Enter("bogus", "bogus");
    EXPECT_TRUE(session_.StillRunning());
}

// The editing keys as the terminal sends them reach the line editor (whose rules its own
// unit test holds): each edit shows on the prompt row, with the cursor where the next
// character goes, and the line entered is the one shown.
TEST_F(PromptTest, EditingKeysAsTheTerminalSendsThem) {
    session_.Type("ogs 1");
    session_.SendKeys({"Home"});
    session_.Type("b");
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogs 1")) << session_.Dump();
    EXPECT_EQ(session_.Cursor(), std::make_pair(PROMPT_ROW, PROMPT_COL + 4)) << session_.Dump();
    session_.SendKeys({"Right", "Right"});
    session_.Type("u");
    session_.SendKeys({"End", "Left", "BSpace"});
    session_.Type("2");
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus21")) << session_.Dump();
    EXPECT_EQ(session_.Cursor(), std::make_pair(PROMPT_ROW, PROMPT_COL + 3 + 6)) << session_.Dump();

    // Keys that are no text change nothing; Tab separates fields like a blank.
    session_.SendKeys({"End", "Escape", "F1", "C-l", "C-g", "NPage", "IC", "Tab"});
    session_.Type("1 2 oops");
    session_.SendKeys({"C-w", "C-w"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus21 1")) << session_.Dump();
    Enter("", "bogus21");
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 2"));

    // Up recalls the line, Down comes back to the draft, Ctrl-U kills it; a recalled line
    // runs again as it was entered.
    session_.Type("draft");
    session_.SendKeys({"Up"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus21 1")) << session_.Dump();
    session_.SendKeys({"Down"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> draft")) << session_.Dump();
    session_.SendKeys({"C-u"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW)) << session_.Dump();
    session_.SendKeys({"Up"});
    Enter("", "bogus21", 2);
    EXPECT_EQ(CountLines(*session_.ReadLog(), "validArgs: 2"), 2u);
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session_.Dump();
    EXPECT_TRUE(session_.StillRunning());
}

TEST_F(PromptTest, LongLineScrollsWithinItsRow) {
    std::string line = "bogus 1 2 3 ";
    while (line.size() < 150) {
        line += "abcdefghij";
    }
    // The window's last column lies past the terminal: the line has the 95 columns from
    // the one after the prompt up to the terminal's last but one.
    constexpr std::size_t SHOWN = 95;
    const int firstCol = PROMPT_COL + 3;
    session_.Type(line);
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> " + line.substr(line.size() - (SHOWN - 1))))
        << session_.Dump();
    EXPECT_EQ(session_.Cursor(),
              std::make_pair(PROMPT_ROW, firstCol + static_cast<int>(SHOWN) - 1));
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "")) << session_.Dump();

    session_.SendKeys({"Home"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> " + line.substr(0, SHOWN)))
        << session_.Dump();
    EXPECT_EQ(session_.Cursor(), std::make_pair(PROMPT_ROW, firstCol));

    Enter("", "bogus");
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 5"));
    EXPECT_TRUE(session_.StillRunning());
}

}  // namespace
}  // namespace lineprobe::testing
