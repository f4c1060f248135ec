// What the prompt does with a line, apart from the terminal: the editing keys, the scan into
// fields, the command table and its lookup, the pager's command line, and the arguments of
// the program.
#include <gtest/gtest.h>

#include <cstring>
#include <initializer_list>
#include <memory>
#include <optional>
#include <string>
#include <variant>
#include <vector>

#include "LogCapture.h"
#include "console/CmdProcessor.h"
#include "console/Command.h"
#include "console/CommandLine.h"
#include "console/CommandTable.h"
#include "console/HelpCmd.h"
#include "console/Lifecycle.h"
#include "console/LineEditor.h"

namespace lineprobe {
namespace {

using testsupport::LogCapture;

struct ScanCase {
    std::string line;
    int fields;
    const char* word;
    int board;
    int trunk;
    int chan;
    const char* text;
};

// Untouched fields keep these values, so a case can tell "not reached" from "read as 0".
constexpr int UNSET = -777;
constexpr const char* PREVIOUS_WORD = "previous";

TEST(ScanCommandLine, SplitsLikeTheScanFormat) {
    const ScanCase cases[] = {
        {"quit", 1, "quit", UNSET, UNSET, UNSET, "untouched"},
        {"quit 1", 2, "quit", 1, UNSET, UNSET, "untouched"},
        {"trunk 1 2", 3, "trunk", 1, 2, UNSET, "untouched"},
        {"makecall 1 1 3", 4, "makecall", 1, 1, 3, "untouched"},
        {"destaddr 2 1 7 5551234", 5, "destaddr", 2, 1, 7, "5551234"},
        {"  phone\t 3   4  5  ", 4, "phone", 3, 4, 5, "untouched"},
        {"phone -1 +2 -3", 4, "phone", -1, 2, -3, "untouched"},
        // A word ends the scan.
        {"phone x 1 2", 1, "phone", UNSET, UNSET, UNSET, "untouched"},
        {"phone 1 y 2", 2, "phone", 1, UNSET, UNSET, "untouched"},
        // A number runs into the text; digits then letters stop the next number.
        {"origaddr 1 2 3abc", 5, "origaddr", 1, 2, 3, "abc"},
        {"phone 12ab 3", 2, "phone", 12, UNSET, UNSET, "untouched"},
        // A lone or doubled sign is no number.
        {"phone - 3", 1, "phone", UNSET, UNSET, UNSET, "untouched"},
        {"phone +-3", 1, "phone", UNSET, UNSET, UNSET, "untouched"},
        {"phone 2147483647 -2147483648 0", 4, "phone", 2147483647, -2147483647 - 1, 0, "untouched"},
        {"quit 1 1 2147483648", 3, "quit", 1, 1, UNSET, "untouched"},
        // Only the first word of the text is kept.
        {"origaddr 1 2 3 555 1212", 5, "origaddr", 1, 2, 3, "555"},
        // An empty or blank line keeps the previous word.
        {"", -1, PREVIOUS_WORD, UNSET, UNSET, UNSET, "untouched"},
        {" \t  ", -1, PREVIOUS_WORD, UNSET, UNSET, UNSET, "untouched"},
    };
    for (const ScanCase& c : cases) {
        SCOPED_TRACE("'" + c.line + "'");
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
}

TEST(ScanCommandLine, LongWordAndTextAreCutToTheirBuffers) {
    // 300 letters and then a number: the number must still be the second field, so the
    // cut-off rest of the word may not be taken for a field of its own.
    struct {
        char word[MAX_BUFFER_SIZE];
        char canary[8];
    } guarded;
    std::memset(&guarded, '#', sizeof guarded);
    char text[MAX_BUFFER_SIZE];
    int board = UNSET;
    int trunk = UNSET;
    int chan = UNSET;

    EXPECT_EQ(
        ScanCommandLine(std::string(300, 'w') + " 42", guarded.word, board, trunk, chan, text), 2);
    EXPECT_EQ(std::string(guarded.word), std::string(255, 'w'));
    EXPECT_EQ(board, 42);
    EXPECT_EQ(std::string(guarded.canary, sizeof guarded.canary), "########");

    const std::string address(1000, '5');
    EXPECT_EQ(ScanCommandLine("destaddr 1 1 1 " + address, guarded.word, board, trunk, chan, text),
              5);
    EXPECT_EQ(std::string(text), std::string(255, '5'));
}

using Key = LineEditor::EditKey;

// A key sequence: strings are typed character by character, numbers pressed as keys.
std::vector<int> Keys(std::initializer_list<std::variant<const char*, int>> parts) {
    std::vector<int> keys;
    for (const auto& part : parts) {
        if (const char* const* text = std::get_if<const char*>(&part)) {
            for (const char* c = *text; *c != '\0'; ++c) {
                keys.push_back(static_cast<unsigned char>(*c));
            }
        } else {
            keys.push_back(std::get<int>(part));
        }
    }
    return keys;
}

constexpr std::size_t ANY_CURSOR = ~std::size_t{0};

// Feeds the keys to the editor; a line entered begins the next one, as the prompt does.
void Feed(LineEditor& editor, const std::vector<int>& keys, std::size_t limit = 1024) {
    for (std::size_t i = 0; i < keys.size(); ++i) {
        const bool enters = keys[i] == '\n' || keys[i] == '\r';
        ASSERT_EQ(editor.Feed(keys[i]) == LineEditor::Result::Entered, enters) << i;
        if (enters && i + 1 < keys.size()) {
            editor.Start(limit);
        }
    }
}

struct EditCase {
    std::vector<int> keys;
    std::string line;
    std::size_t cursor;
    std::size_t limit = 1024;
};

// Each case feeds one editor, so the later keys of a case meet the lines it entered in the
// history.
TEST(LineEditor, KeysEditTheLineAndWalkTheHistory) {
    const int up = Key::Up;
    const int down = Key::Down;
    const int left = Key::Left;
    const EditCase cases[] = {
        {Keys({"phone\t5\t1\t1\r"}), "phone 5 1 1", ANY_CURSOR},
        {Keys({"bo", 0x00, 0x07, 0x0c, 0x1b, 0x80, 0xff, 0x1000, Key::Delete, "gus"}), "bogus", 5},
        // Home and End, and Ctrl-A and Ctrl-E that do the same.
        {Keys({"phone 1 1", left, "2", Key::Home, "x", Key::End, "0"}), "xphone 1 210", 12},
        {Keys({"xphone", 0x01, Key::Right, Key::Delete, 0x05}), "xhone", 5},
        // The cursor stops at both ends, where Delete and Backspace have nothing to take.
        {Keys({"abc", Key::Right, Key::Delete}), "abc", 3},
        {Keys({"abc", Key::Home, left, Key::Backspace}), "abc", 0},
        {Keys({"abcd", left, Key::Backspace}), "abd", 2},
        {Keys({"abcd", left, Key::Backspace, 0x7f, 0x08}), "d", 0},
        // Ctrl-U kills up to the cursor, Ctrl-W the word and blanks behind it.
        {Keys({"makecall 1 1 3", left, left, 0x15}), " 3", 0},
        {Keys({"makecall 1 1 3", 0x15}), "", 0},
        {Keys({"makecall 12 1  ", 0x17}), "makecall 12 ", 12},
        {Keys({"makecall 12 1  ", 0x17, 0x17}), "makecall ", 9},
        {Keys({"makecall ", left, left, left, left, left, 0x17}), "call ", 0},
        {Keys({"makecall ", Key::Home, 0x17}), "makecall ", 0},
        // Typing past the limit is dropped, wherever the cursor is.
        {Keys({"abcdefg"}), "abcde", 5, 5},
        {Keys({"abcdefg", Key::Home, "x"}), "abcde", 0, 5},
        // Up and Down walk the entered lines and come back to the draft.
        {Keys({"phone 1 1 1\ntrunk 1 1\nmake", up}), "trunk 1 1", 9},
        {Keys({"phone 1 1 1\ntrunk 1 1\nmake", up, up, up}), "phone 1 1 1", 11},
        {Keys({"phone 1 1 1\ntrunk 1 1\nmake", up, up, down}), "trunk 1 1", 9},
        {Keys({"phone 1 1 1\ntrunk 1 1\nmake", up, down, down}), "make", 4},
        // A recalled line edited is entered as edited, and the old one stays.
        {Keys({"phone 1 1 1\n", up, Key::Backspace, "2\n"}), "phone 1 1 2", ANY_CURSOR},
        {Keys({"phone 1 1 1\n", up, Key::Backspace, "2\n", up}), "phone 1 1 2", 11},
        {Keys({"phone 1 1 1\n", up, Key::Backspace, "2\n", up, up}), "phone 1 1 1", 11},
        // Blank lines and repeats are not kept.
        {Keys({"quit 1\n\n   \nquit 1\nhelp\n", up, up, up}), "quit 1", 6},
        {Keys({"quit 1\n\n   \nquit 1\nhelp\n", up, up, up, down}), "help", 4},
    };
    for (const EditCase& c : cases) {
        SCOPED_TRACE("'" + c.line + "'");
        LineEditor editor;
        editor.Start(c.limit);
        Feed(editor, c.keys, c.limit);
        EXPECT_EQ(editor.Line(), c.line);
        if (c.cursor != ANY_CURSOR) {
            EXPECT_EQ(editor.Cursor(), c.cursor);
        }
    }
}

TEST(LineEditor, TheLatestHundredLinesAreKept) {
    LineEditor editor;
    editor.Start(1024);
    std::string lines;
    for (int i = 0; i <= 100; ++i) {
        lines += "line " + std::to_string(i) + "\n";
    }
    Feed(editor, Keys({lines.c_str()}));
    editor.Start(1024);
    Feed(editor, std::vector<int>(101, Key::Up));
    EXPECT_EQ(editor.Line(), "line 1");
}

TEST(LineEditor, ALongLineScrollsToKeepTheCursorInView) {
    LineEditor editor;
    editor.Start(1024);
    auto shown = [&](const std::vector<int>& keys) {
        Feed(editor, keys);
        const LineEditor::Visible visible = editor.Show(4);
        return visible.text + "|" + std::to_string(visible.cursor);
    };
    // The cursor at the end takes the last cell.
    EXPECT_EQ(shown(Keys({"abcdefghij"})), "hij|3");
    EXPECT_EQ(shown(std::vector<int>(6, Key::Left)), "efgh|0");
    // Moving right within the shown part does not scroll.
    EXPECT_EQ(shown({Key::Right, Key::Right}), "efgh|2");
    EXPECT_EQ(shown({Key::Home}), "abcd|0");
    // Shortening the line brings text back into view.
    EXPECT_EQ(shown({Key::End, 0x17}), "|0");
    EXPECT_EQ(shown(Keys({"xy"})), "xy|2");
    EXPECT_EQ(editor.Show(0).text, "");
}

TEST(CmdProcessor, RegistersEachNameOnceTracesItAndFindsItExactly) {
    CmdProcessor processor(nullptr);
    Command first("phone");
    Command second("phone");
    Command quit("quit");
    LogCapture out;

    EXPECT_EQ(processor.RegisterCommand(nullptr), -2);
    EXPECT_EQ(out.Text(), "");
    EXPECT_EQ(processor.RegisterCommand(&first), 0);
    EXPECT_EQ(out.Text(), "Calling CmdProcessor::RegisterCommand\ncommand name: phone\n");
    EXPECT_EQ(processor.RegisterCommand(&second), -1);
    processor.RegisterCommand(&quit);

    EXPECT_EQ(processor.FindCommand("phone"), &first);
    EXPECT_EQ(processor.FindCommand("quit"), &quit);
    for (const char* miss : {"QUIT", "Quit", "qui", "quit ", "phone_ins", ""}) {
        EXPECT_EQ(processor.FindCommand(miss), nullptr) << "'" << miss << "'";
    }
    EXPECT_NE(out.Text().find("Calling CmdProcessor::FindCommand: cmdStr= QUIT\n"),
              std::string::npos);
}

std::vector<std::string> RegisteredNames(const std::string& trace) {
    std::vector<std::string> names;
    const std::string marker = "command name: ";
    for (std::size_t at = trace.find(marker); at != std::string::npos;
         at = trace.find(marker, at + 1)) {
        const std::size_t start = at + marker.size();
        names.push_back(trace.substr(start, trace.find('\n', start) - start));
    }
    return names;
}

// Every word of the prompt gets its own command, found under that word; start-up traces
// them in this order (delphone is registered before trunk, though made after it).
TEST(CommandTable, EveryWordIsRegisteredInItsOrderAndFoundUnderItself) {
    const std::vector<std::unique_ptr<Command>> owned = CreateCommands({});
    std::vector<Command*> created;
    for (const std::unique_ptr<Command>& command : owned) {
        ASSERT_NE(command, nullptr);
        created.push_back(command.get());
    }
    CmdProcessor processor(nullptr);
    LogCapture out;

    RegisterCommands(processor, created);

    const std::vector<std::string> names = RegisteredNames(out.Text());
    EXPECT_EQ(names,
              (std::vector<std::string>{
                  "quit",       "help",      "phone",      "delphone", "trunk",    "makecall",
                  "answer",     "accept",    "drop",       "release",  "chan_oos", "chan_ins",
                  "trunk_ins",  "trunk_oos", "origaddr",   "destaddr", "deltrunk", "reset",
                  "disablelbk", "linelbk",   "payloadlbk", "startrai", "stoprai"}));
    for (const std::string& name : names) {
        Command* command = processor.FindCommand(name);
        ASSERT_NE(command, nullptr) << name;
        EXPECT_EQ(command->GetCommandName(), name);
    }
}

TEST(CommandTable, UnknownWordIsRegisteredLastRatherThanLost) {
    Command extra("selftest");
    Command quit("quit");
    CmdProcessor processor(nullptr);
    LogCapture out;

    RegisterCommands(processor, {&extra, nullptr, &quit});

    EXPECT_EQ(RegisteredNames(out.Text()), (std::vector<std::string>{"quit", "selftest"}));
    EXPECT_EQ(processor.FindCommand("selftest"), &extra);
}

TEST(HelpCmd, PagerCommandJoinsDirectoryBinAndFileWithinTwoHundredFiftyFiveCharacters) {
    EXPECT_EQ(HelpCmd::BuildPagerCommand("/opt/orvane/", "lineprobe_help.txt"),
              std::optional<std::string>("less /opt/orvane/bin/lineprobe_help.txt"));
    // No separator is added: the directory carries its own trailing slash.
    EXPECT_EQ(HelpCmd::BuildPagerCommand("/opt/orvane", "lineprobe_help.txt"),
              std::optional<std::string>("less /opt/orvanebin/lineprobe_help.txt"));

    // "less " (5) + directory + "bin/" (4) + "lineprobe_help.txt" (18) = 27 + directory.
    const std::string fits = "/" + std::string(226, 'd') + "/";     // 228: line of 255
    const std::string tooLong = "/" + std::string(227, 'd') + "/";  // 229: line of 256
    EXPECT_EQ(HelpCmd::BuildPagerCommand(fits, "lineprobe_help.txt").value_or("").size(), 255u);
    EXPECT_FALSE(HelpCmd::BuildPagerCommand(tooLong, "lineprobe_help.txt").has_value());
    EXPECT_FALSE(HelpCmd::BuildPagerCommand(std::string(5000, 'x'), "lineprobe_help.txt"));
}

struct OptionCase {
    std::vector<std::string> args;
    std::string output;
    int stoppedAt;
};

TEST(ProcessCmdLineArgs, PrintsAndStops) {
    const std::string usage =
        "for help on using lineprobe, look in /usr/orvane/bin/lineprobe_help.txt\n";
    const std::string version = "lineprobe version 1.0\n";
    const std::string invalid = "invalid argument\n" + usage;
    const std::string count =
        "invalid argument count\nvalid arguments are:\n-v\tshow version\n-h\thelp info \n";
    const OptionCase cases[] = {
        {{"-v"}, version, 1},
        {{"-h"}, usage, 1},
        {{"-v", "-h"}, version + usage, 2},
        {{"-h", "-v"}, usage + version, 2},
        {{"-x"}, invalid, 0},
        {{"-V"}, invalid, 0},
        {{"-v", "bogus"}, version + invalid, 1},
        // An unknown argument stops the walk.
        {{"bogus", "-v"}, invalid, 0},
        {{"-v", "-h", "-v"}, count, 0},
    };
    for (const OptionCase& c : cases) {
        SCOPED_TRACE(c.args[0] + " (" + std::to_string(c.args.size()) + " arguments)");
        std::vector<std::string> args = c.args;
        std::vector<char*> argv;
        for (std::string& arg : args) {
            argv.push_back(arg.data());
        }
        argv.push_back(nullptr);
        LogCapture out;

        const int stoppedAt = ProcessCmdLineArgs(static_cast<int>(args.size()), argv.data());

        EXPECT_EQ(out.Text(), c.output);
        EXPECT_EQ(stoppedAt, c.stoppedAt);
    }
}

}  // namespace
}  // namespace lineprobe
