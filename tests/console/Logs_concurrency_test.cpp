// The two logs: std::cout and std::cerr redirected to their files, which every thread writes.
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <set>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "console/Redirect.h"

namespace lineprobe {
namespace {

std::string Slurp(const std::filesystem::path& path) {
    std::ifstream file(path);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

// A fresh directory for the log files of one test, and std::cout and std::cerr put back on the
// buffers they had, whatever the test redirected them to.
class RedirectTest : public ::testing::Test {
  protected:
    void SetUp() override {
        std::string pattern = (std::filesystem::temp_directory_path() / "lp-redir-XXXXXX").string();
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        dir_ = pattern;
        savedCout_ = std::cout.rdbuf();
        savedCerr_ = std::cerr.rdbuf();
    }
    void TearDown() override {
        std::cout.rdbuf(savedCout_);
        std::cerr.rdbuf(savedCerr_);
        std::filesystem::remove_all(dir_);
    }

    std::filesystem::path dir_;
    std::streambuf* savedCout_ = nullptr;
    std::streambuf* savedCerr_ = nullptr;
};

TEST_F(RedirectTest, CoutAndCerrGoToTheirOwnTruncatedFiles) {
    const std::filesystem::path out = dir_ / "lineprobe.log";
    const std::filesystem::path err = dir_ / "lineprobe_err.log";
    std::ofstream(out) << "left over from the last run\n";

    ASSERT_TRUE(Redirect(std::cout, out.c_str()));
    ASSERT_TRUE(Redirect(std::cerr, err.c_str()));
    std::cout << "first line" << std::endl;
    std::cerr << "an error" << std::endl;

    EXPECT_EQ(Slurp(out), "first line\n");
    EXPECT_EQ(Slurp(err), "an error\n");
    EXPECT_EQ(sbuf_cout, savedCout_);
    EXPECT_EQ(sbuf_cerr, savedCerr_);
}

TEST_F(RedirectTest, OtherStreamsAndUnopenableFilesAreRefused) {
    std::ostringstream other;
    const std::filesystem::path log = dir_ / "other.log";
    EXPECT_FALSE(Redirect(other, log.c_str()));
    EXPECT_FALSE(Redirect(std::clog, log.c_str()));
    EXPECT_FALSE(std::filesystem::exists(log));

    EXPECT_FALSE(Redirect(std::cout, (dir_ / "no-such-dir" / "lineprobe.log").c_str()));
    EXPECT_EQ(std::cout.rdbuf(), savedCout_);
}

constexpr int kWriters = 6;
constexpr int kLinesEach = 4000;

// The line that writer `w` writes as its `i`-th, of a length that varies from line to line.
std::string WrittenLine(const std::string& tag, int w, int i) {
    return tag + " writer " + std::to_string(w) + " line " + std::to_string(i) + " " +
           std::string(static_cast<std::size_t>(1 + (i * 7 + w) % 90), 'x') + " end";
}

// Every line of the file must be one that a writer wrote, whole, and each exactly once.
void ExpectEveryLineOnce(const std::filesystem::path& log, const std::string& tag) {
    std::set<std::string> unseen;
    for (int w = 0; w < kWriters; ++w) {
        for (int i = 0; i < kLinesEach; ++i) {
            unseen.insert(WrittenLine(tag, w, i));
        }
    }
    std::ifstream file(log);
    int wrong = 0;
    for (std::string line; std::getline(file, line);) {
        if (unseen.erase(line) == 0 && ++wrong <= 3) {
            ADD_FAILURE() << log.filename() << ": torn or repeated line \"" << line << "\"";
        }
    }
    EXPECT_EQ(wrong, 0) << log.filename();
    EXPECT_TRUE(unseen.empty()) << log.filename() << ": " << unseen.size() << " lines missing";
}

// Threads trace as the reader threads and the main thread do: each line in several pieces,
// ended by std::endl (cout) or '\n' on a unit-buffered stream (cerr), all at once.
TEST_F(RedirectTest, LinesFromManyThreadsComeOutWholeAndExactlyOnce) {
    const std::filesystem::path out = dir_ / "lineprobe.log";
    const std::filesystem::path err = dir_ / "lineprobe_err.log";
    ASSERT_TRUE(Redirect(std::cout, out.c_str()));
    ASSERT_TRUE(Redirect(std::cerr, err.c_str()));

    std::vector<std::thread> writers;
    for (int w = 0; w < kWriters; ++w) {
        writers.emplace_back([w] {
            for (int i = 0; i < kLinesEach; ++i) {
                const std::string filler(static_cast<std::size_t>(1 + (i * 7 + w) % 90), 'x');
                std::cout << "trace writer " << w << " line " << i << " " << filler << " end"
                          << std::endl;
                std::cerr << "error writer " << w << " line " << i << " " << filler << " end"
                          << '\n';
            }
        });
    }
    for (std::thread& writer : writers) {
        writer.join();
    }
    std::cout.rdbuf(savedCout_);
    std::cerr.rdbuf(savedCerr_);

    ExpectEveryLineOnce(out, "trace");
    ExpectEveryLineOnce(err, "error");
}

// A line begun but not ended when its thread finishes is neither lost nor spliced into the
// next line that another thread writes.
TEST_F(RedirectTest, UnfinishedLineOfAnEndedThreadIsWrittenWhole) {
    const std::filesystem::path out = dir_ / "lineprobe.log";
    ASSERT_TRUE(Redirect(std::cout, out.c_str()));

    std::thread([] { std::cout << "begun " << 1 << " but never ended"; }).join();
    std::cout << "main thread line" << std::endl;
    std::cout.rdbuf(savedCout_);

    EXPECT_EQ(Slurp(out), "begun 1 but never ended\nmain thread line\n");
}

}  // namespace
}  // namespace lineprobe
