#include "console/LineEditor.h"

#include <gtest/gtest.h>

#include <initializer_list>
#include <string>

#include "console/CommandLine.h"

namespace lineprobe {
namespace {

using Key = LineEditor::EditKey;

class LineEditorTest : public ::testing::Test {
  protected:
    void SetUp() override { editor.Start(1024); }

    void Type(const std::string& text) {
        for (char c : text) {
            EXPECT_EQ(editor.Feed(static_cast<unsigned char>(c)), LineEditor::Result::Editing);
        }
    }
    void Press(std::initializer_list<int> keys) {
        for (int key : keys) {
            editor.Feed(key);
        }
    }
    // Enters a line and begins the next one, as the prompt does.
    void Enter(const std::string& text) {
        Type(text);
        ASSERT_EQ(editor.Feed('\n'), LineEditor::Result::Entered);
        editor.Start(1024);
    }

    LineEditor editor;
};

TEST_F(LineEditorTest, TabSeparatesFieldsLikeABlank) {
    Type("phone\t5\t1\t1");
    EXPECT_EQ(editor.Line(), "phone 5 1 1");

    char word[MAX_BUFFER_SIZE] = {};
    char text[MAX_BUFFER_SIZE] = {};
    int board = 0, trunk = 0, chan = 0;
    EXPECT_EQ(ScanCommandLine(editor.Line(), word, board, trunk, chan, text), 4);
    EXPECT_EQ(std::string(word), "phone");
    EXPECT_EQ(board, 5);
    EXPECT_EQ(trunk, 1);
    EXPECT_EQ(chan, 1);
}

TEST_F(LineEditorTest, EnterReturnsTheLineAndCarriageReturnDoesToo) {
    Type("quit");
    EXPECT_EQ(editor.Feed('\r'), LineEditor::Result::Entered);
    EXPECT_EQ(editor.Line(), "quit");
}

TEST_F(LineEditorTest, ControlCharactersAndForeignBytesAreIgnored) {
    Type("bo");
    Press({0x00, 0x07, 0x0c, 0x1b, 0x80, 0xff, 0x1000, Key::Delete});
    Type("gus");
    EXPECT_EQ(editor.Line(), "bogus");
    EXPECT_EQ(editor.Cursor(), 5u);
}

TEST_F(LineEditorTest, CursorKeysMoveWithinTheLineAndTypingInserts) {
    Type("phone 1 1");
    Press({Key::Left});
    Type("2");
    EXPECT_EQ(editor.Line(), "phone 1 21");
    Press({Key::Home});
    Type("x");
    EXPECT_EQ(editor.Line(), "xphone 1 21");
    Press({Key::End});
    Type("0");
    EXPECT_EQ(editor.Line(), "xphone 1 210");
    // Ctrl-A and Ctrl-E do what Home and End do.
    Press({0x01, Key::Right, Key::Delete, 0x05});
    EXPECT_EQ(editor.Line(), "xhone 1 210");
    EXPECT_EQ(editor.Cursor(), editor.Line().size());
}

TEST_F(LineEditorTest, CursorStopsAtBothEnds) {
    Type("ab");
    Press({Key::Right, Key::Right});
    EXPECT_EQ(editor.Cursor(), 2u);
    Press({Key::Left, Key::Left, Key::Left, Key::Backspace});
    EXPECT_EQ(editor.Cursor(), 0u);
    EXPECT_EQ(editor.Line(), "ab");
    Press({Key::End, Key::Delete});
    EXPECT_EQ(editor.Line(), "ab");
}

TEST_F(LineEditorTest, EveryBackspaceCodeErasesBeforeTheCursor) {
    Type("abcd");
    Press({Key::Left, Key::Backspace});
    EXPECT_EQ(editor.Line(), "abd");
    Press({0x7f});
    EXPECT_EQ(editor.Line(), "ad");
    Press({0x08});
    EXPECT_EQ(editor.Line(), "d");
    EXPECT_EQ(editor.Cursor(), 0u);
}

TEST_F(LineEditorTest, CtrlUKillsFromTheStartToTheCursor) {
    Type("makecall 1 1 3");
    Press({Key::Left, Key::Left, 0x15});
    EXPECT_EQ(editor.Line(), " 3");
    EXPECT_EQ(editor.Cursor(), 0u);
    Press({Key::End, 0x15});
    EXPECT_EQ(editor.Line(), "");
}

TEST_F(LineEditorTest, CtrlWKillsTheWordBehindTheCursor) {
    Type("makecall 12 1  ");
    Press({0x17});
    EXPECT_EQ(editor.Line(), "makecall 12 ");
    Press({0x17});
    EXPECT_EQ(editor.Line(), "makecall ");
    // Within a word it takes only the part behind the cursor.
    Press({Key::Left, Key::Left, Key::Left, Key::Left, Key::Left, 0x17});
    EXPECT_EQ(editor.Line(), "call ");
    EXPECT_EQ(editor.Cursor(), 0u);
    Press({0x17});
    EXPECT_EQ(editor.Line(), "call ");
}

TEST_F(LineEditorTest, TypingPastTheLimitIsDropped) {
    editor.Start(5);
    Type("abcdefg");
    EXPECT_EQ(editor.Line(), "abcde");
    Press({Key::Home});
    Type("x");
    EXPECT_EQ(editor.Line(), "abcde");
}

TEST_F(LineEditorTest, UpAndDownWalkTheEnteredLinesAndComeBackToTheDraft) {
    Enter("phone 1 1 1");
    Enter("trunk 1 1");
    Type("make");
    Press({Key::Up});
    EXPECT_EQ(editor.Line(), "trunk 1 1");
    EXPECT_EQ(editor.Cursor(), editor.Line().size());
    Press({Key::Up, Key::Up});
    EXPECT_EQ(editor.Line(), "phone 1 1 1");
    Press({Key::Down});
    EXPECT_EQ(editor.Line(), "trunk 1 1");
    Press({Key::Down, Key::Down});
    EXPECT_EQ(editor.Line(), "make");
}

TEST_F(LineEditorTest, AnEditedRecalledLineIsEnteredAsEditedAndTheOldOneStays) {
    Enter("phone 1 1 1");
    Press({Key::Up, Key::Backspace});
    Type("2");
    ASSERT_EQ(editor.Feed('\n'), LineEditor::Result::Entered);
    EXPECT_EQ(editor.Line(), "phone 1 1 2");
    editor.Start(1024);
    Press({Key::Up});
    EXPECT_EQ(editor.Line(), "phone 1 1 2");
    Press({Key::Up});
    EXPECT_EQ(editor.Line(), "phone 1 1 1");
}

TEST_F(LineEditorTest, BlankLinesAndRepeatsAreNotKept) {
    Enter("quit 1");
    Enter("");
    Enter("   ");
    Enter("quit 1");
    Enter("help");
    Press({Key::Up, Key::Up});
    EXPECT_EQ(editor.Line(), "quit 1");
    Press({Key::Up});
    EXPECT_EQ(editor.Line(), "quit 1");  // the oldest: Up goes no further
    Press({Key::Down});
    EXPECT_EQ(editor.Line(), "help");
}

TEST_F(LineEditorTest, TheLatestHundredLinesAreKept) {
    for (int i = 0; i <= 100; ++i) {
        Enter("line " + std::to_string(i));
    }
    for (int i = 0; i < 100; ++i) {
        Press({Key::Up});
    }
    EXPECT_EQ(editor.Line(), "line 1");
    Press({Key::Up});
    EXPECT_EQ(editor.Line(), "line 1");
}

TEST_F(LineEditorTest, ALongLineScrollsToKeepTheCursorInView) {
    Type("abcdefghij");
    LineEditor::Visible shown = editor.Show(4);
    // The cursor at the end takes the last cell.
    EXPECT_EQ(shown.text, "hij");
    EXPECT_EQ(shown.cursor, 3u);

    Press({Key::Left, Key::Left, Key::Left, Key::Left, Key::Left, Key::Left});
    shown = editor.Show(4);
    EXPECT_EQ(shown.text, "efgh");
    EXPECT_EQ(shown.cursor, 0u);

    // Moving right within the shown part does not scroll.
    Press({Key::Right, Key::Right});
    shown = editor.Show(4);
    EXPECT_EQ(shown.text, "efgh");
    EXPECT_EQ(shown.cursor, 2u);

    Press({Key::Home});
    shown = editor.Show(4);
    EXPECT_EQ(shown.text, "abcd");
    EXPECT_EQ(shown.cursor, 0u);
}

TEST_F(LineEditorTest, ShorteningALongLineBringsTextBackIntoView) {
    Type("abcdefghij");
    ASSERT_EQ(editor.Show(4).text, "hij");
    Press({0x17});
    const LineEditor::Visible shown = editor.Show(4);
    EXPECT_EQ(shown.text, "");
    EXPECT_EQ(shown.cursor, 0u);
    Type("xy");
    EXPECT_EQ(editor.Show(4).text, "xy");
    EXPECT_EQ(editor.Show(0).text, "");
}

}  // namespace
}  // namespace lineprobe
