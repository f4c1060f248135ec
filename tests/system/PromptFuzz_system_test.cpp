// Prompt fuzz: thousands of random lines typed into a running lineprobe on its built-in
// emulation: command words with numbers out of range, negative and huge, long lines, bytes
// that are no text. The process must live through all of them and the screen layout must
// stay as start-up drew it: system view, head rows and the three separators.
//
// Keys the terminal turns into signals (C-c, C-z, C-backslash), flow control (C-s, C-q) and the
// literal-next key (C-v, which would join a line to the next) are not typed: they act on
// the terminal, not on lineprobe. A line
// whose first word is "quit" is not typed either.
// LINEPROBE_FUZZ_LINES sets the number of lines (default 1000, 800 under a sanitizer),
// LINEPROBE_FUZZ_SEED the sequence; scripts/promptfuzz runs the long form.
#include <gtest/gtest.h>

#include <array>
#include <chrono>
#include <cstdio>
#include <random>
#include <string>
#include <vector>

#include "ConsoleScreen.h"
#include "SystemRun.h"
#include "TerminalSession.h"
#include "console/CommandTable.h"

namespace lineprobe::testing {
namespace {

// Every word of the prompt but quit, which would end the run.
std::vector<std::string> Words() {
    std::vector<std::string> words;
    for (const CommandEntry& entry : COMMAND_TABLE) {
        if (entry.word != "quit") {
            words.emplace_back(entry.word);
        }
    }
    return words;
}

const std::vector<std::string> WORDS = Words();

constexpr std::array<const char*, 14> NUMBERS{"0",
                                              "1",
                                              "2",
                                              "3",
                                              "23",
                                              "31",
                                              "32",
                                              "64",
                                              "65",
                                              "-1",
                                              "-2147483648",
                                              "2147483647",
                                              "99999999999999999999",
                                              "4294967296"};

bool Forbidden(unsigned char c) {
    return c == 0 || c == '\n' || c == '\r' || c == 0x03 || c == 0x0f || c == 0x11 || c == 0x13 ||
           c == 0x16 || c == 0x1a || c == 0x1c;
}

class LineMaker {
  public:
    explicit LineMaker(unsigned seed) : random_(seed) {}

    std::string Next() {
        std::string line;
        switch (random_() % 8) {
            case 0:  // a word and one to five fields, mostly numbers
            case 1:
            case 2: {
                line = WORDS[random_() % WORDS.size()];
                const unsigned fields = random_() % 5;
                for (unsigned i = 0; i < fields; ++i) {
                    line += ' ';
                    line += random_() % 5 == 0 ? Junk(1 + random_() % 12) : Number();
                }
                break;
            }
            case 3:  // a known word followed by a long text field
                line = WORDS[random_() % WORDS.size()] + " 1 1 1 " +
                       std::string(200 + random_() % 400, static_cast<char>('0' + random_() % 10));
                break;
            case 4:  // one long word, longer than any buffer of the prompt
                line = std::string(250 + random_() % 1500, static_cast<char>('a' + random_() % 26));
                break;
            case 5:  // bytes that are no text
                line = Junk(1 + random_() % 80);
                break;
            case 6:  // only blanks, or nothing at all
                line = std::string(random_() % 4, ' ');
                break;
            default:  // numbers and signs without a word
                for (unsigned i = 0, n = 1 + random_() % 6; i < n; ++i) {
                    line += Number() + (random_() % 2 ? " " : "\t");
                }
                break;
        }
        const std::size_t first = line.find_first_not_of(" \t");
        if (first != std::string::npos && line.compare(first, 4, "quit") == 0) {
            line[first] = 'Q';
        }
        // The terminal driver takes a leading '-' as an option; a blank before it changes
        // nothing for the prompt's scan.
        if (!line.empty() && line.front() == '-') {
            line.insert(line.begin(), ' ');
        }
        return line;
    }

  private:
    std::string Number() {
        if (random_() % 3 == 0) {
            return std::to_string(static_cast<int>(random_()));
        }
        return NUMBERS[random_() % NUMBERS.size()];
    }
    std::string Junk(std::size_t length) {
        std::string text;
        while (text.size() < length) {
            const auto c = static_cast<unsigned char>(random_() % 256);
            if (!Forbidden(c)) {
                text += static_cast<char>(c);
            }
        }
        return text;
    }

    std::mt19937 random_;
};

// The rows start-up draws and nothing typed may change: the system view, its separator,
// the two head rows and the other separators.
constexpr std::array<int, 15> FIXED_ROWS{0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 11, 12, 23, 24, 35};

TEST(PromptFuzz, RandomLinesNeitherCrashNorBreakTheLayout) {
    const long lines = EnvNumber("LINEPROBE_FUZZ_LINES", UNDER_SANITIZER ? 800 : 1000);
    const auto seed = static_cast<unsigned>(EnvNumber("LINEPROBE_FUZZ_SEED", 20261123));
    TerminalOptions options;
    options.unsetEnv = {"REMOTE_TKHOST", "VX7_FARM", "CORVO_ORVANE_DIR"};
    TerminalSession session(options);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    const std::vector<std::string> before = session.Screen();
    for (const int row : {11, 23, 35}) {
        ASSERT_TRUE(IsSeparatorRow(before[static_cast<std::size_t>(row)])) << session.Dump();
    }
    ASSERT_EQ(before[12].substr(2, 5), "B.L.C");
    ASSERT_EQ(before[24].substr(2, 3), "B.L");

    LineMaker maker(seed);
    std::vector<std::string> recent;
    long sync = 0;
    const auto start = Clock::now();
    for (long typed = 0; typed < lines;) {
        recent.clear();
        // One batch is typed at once, each line ended by a carriage return as the Enter
        // key sends it.
        const auto batchStart = Clock::now();
        std::string batch;
        for (int i = 0; i < 40 && typed < lines; ++i, ++typed) {
            recent.push_back(maker.Next());
            batch += recent.back() + '\r';
        }
        session.Type(batch);
        // A marker line: once its lookup is in the log, every line before it was read.
        const std::string marker = "zz_sync_" + std::to_string(++sync);
        session.TypeLine(marker);
        const bool read = session.WaitForLogLine("lineprobe.log", LOOKUP_TRACE + marker,
                                                 std::chrono::seconds(60));
        std::string last;
        for (const std::string& line : recent) {
            std::string shown;
            for (const char c : line.substr(0, 60)) {
                shown += c >= ' ' && c < 0x7f ? std::string(1, c) : std::string("?");
            }
            last += "  [" + shown + (line.size() > 60 ? "..." : "") + "]\n";
        }
        // A batch that held the prompt for seconds waited on the board: worth seeing.
        const auto batchTook = Clock::now() - batchStart;
        if (batchTook > std::chrono::seconds(3)) {
            std::printf("batch ending at line %ld took %.1f s:\n%s", typed,
                        std::chrono::duration<double>(batchTook).count(), last.c_str());
        }
        ASSERT_TRUE(session.StillRunning()) << "after the lines:\n" << last << session.Dump();
        ASSERT_TRUE(read) << "the prompt stopped reading; last lines:\n" << last << session.Dump();
        ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW, std::chrono::seconds(30)))
            << last << session.Dump();
        const std::vector<std::string> screen = session.Screen();
        for (const int row : FIXED_ROWS) {
            ASSERT_EQ(screen[static_cast<std::size_t>(row)], before[static_cast<std::size_t>(row)])
                << "row " << row << " changed after the lines:\n"
                << last << session.Dump();
        }
        ASSERT_EQ(Trimmed(screen[RESULT_ROW]), "  Unrecgnized Command") << last << session.Dump();
    }
    const double took = std::chrono::duration<double>(Clock::now() - start).count();
    EXPECT_TRUE(session.StillRunning());
    std::printf("prompt fuzz: %ld lines (seed %u) in %.1f s\n", lines, seed, took);
}

}  // namespace
}  // namespace lineprobe::testing
