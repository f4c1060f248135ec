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

TEST_F(PromptTest, UnknownWordPrintsUnrecognized) {
    Enter("bogus 1 2 3", "bogus");
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session_.Dump();
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 4"));
    EXPECT_TRUE(session_.StillRunning());
}

TEST_F(PromptTest, WordsAreCaseSensitive) {
    for (const char* word : {"QUIT", "Quit", "Help"}) {
        Enter(word, word);
        EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << word << "\n"
                                                                              << session_.Dump();
        EXPECT_TRUE(session_.StillRunning()) << word;
    }
}

TEST_F(PromptTest, EmptyFirstLineLooksUpTheEmptyWord) {
    Enter("", "");
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session_.Dump();
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: -1"));
    EXPECT_TRUE(session_.StillRunning());
}

TEST_F(PromptTest, NextLineWipesTheResultRow) {
    Enter("bogus", "bogus");
    ASSERT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session_.Dump();

    Enter("quit 7", "quit");
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "")) << session_.Dump();
    EXPECT_TRUE(session_.StillRunning());
}

class QuitIgnoredTest : public PromptTest, public ::testing::WithParamInterface<const char*> {};

TEST_P(QuitIgnoredTest, OtherFieldCountsDoNothing) {
    Enter(GetParam(), "quit");
    EXPECT_TRUE(session_.StillRunning());
    EXPECT_EQ(ResultRow().find_first_not_of(' '), std::string::npos) << session_.Dump();
    EXPECT_EQ(session_.ReadLog()->find("terninating"), std::string::npos);
}

INSTANTIATE_TEST_SUITE_P(Lines, QuitIgnoredTest,
                         ::testing::Values("quit 1", "quit 1 2", "quit 1 2 3 now",
                                           "quit 1 1 99999999999"));

TEST_F(PromptTest, EmptyLineRepeatsTheLookupButCallsNothing) {
    Enter("quit 1", "quit");
    Enter("", "quit", 2);
    Enter("   ", "quit", 3);
    EXPECT_TRUE(session_.StillRunning());
    EXPECT_EQ(ResultRow().find_first_not_of(' '), std::string::npos) << session_.Dump();
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

TEST_F(PromptTest, ControlCharactersAndKeysAreIgnored) {
    session_.Type("bo");
    session_.SendKeys({"Escape", "F1", "C-l", "C-g", "NPage", "IC"});
    session_.Type("gus");
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus")) << session_.Dump();

    session_.SendKeys({"Enter"});
    ASSERT_TRUE(WaitForLookups("Calling CmdProcessor::FindCommand: cmdStr= bogus", 1))
        << session_.Dump();
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session_.Dump();
    EXPECT_TRUE(session_.StillRunning());
}

TEST_F(PromptTest, TabSeparatesFields) {
    session_.Type("bogus");
    for (const char* number : {"1", "2", "3"}) {
        session_.SendKeys({"Tab"});
        session_.Type(number);
    }
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus 1 2 3")) << session_.Dump();
    Enter("", "bogus");
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 4"));
    EXPECT_TRUE(session_.StillRunning());
}

TEST_F(PromptTest, CursorKeysEditWithinTheLine) {
    session_.Type("ogs 1");
    session_.SendKeys({"Home"});
    session_.Type("b");
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogs 1")) << session_.Dump();
    // The cursor stands where the next character goes: after the "b".
    EXPECT_EQ(session_.Cursor(), std::make_pair(PROMPT_ROW, PROMPT_COL + 4)) << session_.Dump();

    session_.SendKeys({"Right", "Right"});
    session_.Type("u");
    session_.SendKeys({"End", "Left", "BSpace"});
    session_.Type("2");
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus21")) << session_.Dump();
    EXPECT_EQ(session_.Cursor(), std::make_pair(PROMPT_ROW, PROMPT_COL + 3 + 6)) << session_.Dump();

    Enter("", "bogus21");
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 1"));
    EXPECT_TRUE(session_.StillRunning());
}

TEST_F(PromptTest, CtrlUAndCtrlWKillBehindTheCursor) {
    session_.Type("wrong words bogus");
    session_.SendKeys({"Left", "Left", "Left", "Left", "Left", "C-u"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus")) << session_.Dump();
    session_.SendKeys({"End"});
    session_.Type(" 1 2 oops");
    session_.SendKeys({"C-w", "C-w"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus 1")) << session_.Dump();
    // Ctrl-U is not text: the line holds the word and one number.
    Enter("", "bogus");
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 2"));
    EXPECT_TRUE(session_.StillRunning());
}

TEST_F(PromptTest, UpAndDownRecallEarlierLines) {
    Enter("bogus 1", "bogus");
    Enter("other 1 2", "other");
    session_.Type("draft");
    session_.SendKeys({"Up"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> other 1 2")) << session_.Dump();
    session_.SendKeys({"Up"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus 1")) << session_.Dump();
    session_.SendKeys({"Down"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> other 1 2")) << session_.Dump();
    session_.SendKeys({"Down"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> draft")) << session_.Dump();

    // A recalled line runs again as typed.
    session_.SendKeys({"C-u", "Up", "Up"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus 1")) << session_.Dump();
    Enter("", "bogus", 2);
    const std::string log = *session_.ReadLog();
    EXPECT_EQ(CountLines(log, "validArgs: 2"), 2u) << log;
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

TEST_F(PromptTest, BackspaceErasesTheLastCharacter) {
    session_.Type("boguszz");
    session_.SendKeys({"BSpace", "BSpace"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus")) << session_.Dump();
    session_.SendKeys({"Enter"});
    EXPECT_TRUE(WaitForLookups("Calling CmdProcessor::FindCommand: cmdStr= bogus", 1))
        << session_.Dump();
    EXPECT_TRUE(session_.StillRunning());
}

}  // namespace
}  // namespace lineprobe::testing
