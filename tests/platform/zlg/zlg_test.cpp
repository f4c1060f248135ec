#include "platform/zlg/zlg.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

namespace {

// Points VX7_TRACE_FILE at a fresh file for one test and reads back its lines.
class TraceFile {
  public:
    explicit TraceFile(const std::string& name)
        : path_(::testing::TempDir() + name + "_" + std::to_string(::getpid()) + ".log") {
        ::unlink(path_.c_str());
        ::setenv(ZLG_TRACE_FILE_ENV, path_.c_str(), 1);
    }
    ~TraceFile() {
        ::unsetenv(ZLG_TRACE_FILE_ENV);
        ::unlink(path_.c_str());
    }
    const std::string& path() const { return path_; }
    std::vector<std::string> lines() const {
        std::ifstream in(path_);
        std::vector<std::string> out;
        for (std::string line; std::getline(in, line);) {
            out.push_back(line);
        }
        return out;
    }

  private:
    std::string path_;
};

// "2024-05-01 12:00:00.123 ": D for a digit, anything else literal.
constexpr std::string_view kStamp = "DDDD-DD-DD DD:DD:DD.DDD ";

// The line without its time stamp, after checking that it starts with one.
std::string body(const std::string& line) {
    bool stamped = line.size() >= kStamp.size();
    for (std::size_t i = 0; stamped && i < kStamp.size(); ++i) {
        stamped = kStamp[i] == 'D' ? (line[i] >= '0' && line[i] <= '9') : line[i] == kStamp[i];
    }
    EXPECT_TRUE(stamped) << line;
    return stamped ? line.substr(kStamp.size()) : line;
}

TEST(ZlgHandles, SameNameSameHandleOtherNameAnotherAndBadArgumentsAreRefused) {
    ZLG_HANDLE a = 0, b = 0, c = 0, label = 0, again = 0;
    EXPECT_EQ(ZlgGetModuleHandle("HandlesTestA", &a), ZLG_SUCCESS);
    EXPECT_EQ(ZlgGetModuleHandle("HandlesTestB", &b), ZLG_SUCCESS);
    EXPECT_EQ(ZlgGetModuleHandle("HandlesTestA", &c), ZLG_SUCCESS);
    EXPECT_GE(a, 1u);
    EXPECT_LE(a, static_cast<ZLG_HANDLE>(ZLG_MAX_NAMES));
    EXPECT_NE(a, b);
    EXPECT_EQ(a, c);
    EXPECT_EQ(ZlgGetLabelHandle("HandlesTestLabel", &label), ZLG_SUCCESS);
    EXPECT_EQ(ZlgGetLabelHandle("HandlesTestLabel", &again), ZLG_SUCCESS);
    EXPECT_GE(label, 1u);
    EXPECT_EQ(label, again);
    ZLG_HANDLE h = 42;
    EXPECT_EQ(ZlgGetModuleHandle(nullptr, &h), ZLG_ERR_INVALID_ARGUMENT);
    EXPECT_EQ(ZlgGetModuleHandle("", &h), ZLG_ERR_INVALID_ARGUMENT);
    EXPECT_EQ(ZlgGetModuleHandle("X", nullptr), ZLG_ERR_INVALID_ARGUMENT);
    EXPECT_EQ(ZlgGetLabelHandle(nullptr, &h), ZLG_ERR_INVALID_ARGUMENT);
    EXPECT_EQ(h, 42u);
}

TEST(ZlgTrace, EachCallIsOneStampedLineUnderItsModuleAndLabelAndBadOnesWriteNothing) {
    TraceFile trace("zlg_lines");
    ZLG_HANDLE module = 0, label = 0;
    ASSERT_EQ(ZlgGetModuleHandle("Ocelot", &module), ZLG_SUCCESS);
    ASSERT_EQ(ZlgGetLabelHandle("Error", &label), ZLG_SUCCESS);
    EXPECT_EQ(ZlgTraceNoClient(module, label, "brd 1 trunk 1 chan 3: Connected"), ZLG_SUCCESS);
    EXPECT_EQ(ZlgTraceMessageVarg("Unable to retrieve module handle, ZlgRet = %d", 3), ZLG_SUCCESS);
    // Line breaks stay on one line; a long text is written whole.
    EXPECT_EQ(ZlgTraceNoClient(module, label, "one\ntwo\r\n"), ZLG_SUCCESS);
    const std::string text(5000, 'x');
    EXPECT_EQ(ZlgTraceMessageVarg("%s|", text.c_str()), ZLG_SUCCESS);
    // Unknown handles and a missing text are refused and write nothing.
    EXPECT_EQ(ZlgTraceNoClient(0, label, "x"), ZLG_ERR_INVALID_HANDLE);
    EXPECT_EQ(ZlgTraceNoClient(module, 0, "x"), ZLG_ERR_INVALID_HANDLE);
    EXPECT_EQ(ZlgTraceNoClient(ZLG_MAX_NAMES + 1, label, "x"), ZLG_ERR_INVALID_HANDLE);
    EXPECT_EQ(ZlgTraceNoClient(module, label, nullptr), ZLG_ERR_INVALID_ARGUMENT);
    EXPECT_EQ(ZlgTraceMessageVarg(nullptr), ZLG_ERR_INVALID_ARGUMENT);
    auto lines = trace.lines();
    ASSERT_EQ(lines.size(), 4u);
    EXPECT_EQ(body(lines[0]), "Ocelot/Error: brd 1 trunk 1 chan 3: Connected");
    EXPECT_EQ(body(lines[1]), "-: Unable to retrieve module handle, ZlgRet = 3");
    EXPECT_EQ(body(lines[2]), "Ocelot/Error: one two  ");
    EXPECT_EQ(body(lines[3]), "-: " + text + "|");
}

TEST(ZlgTrace, UnwritableFileIsReported) {
    TraceFile trace("zlg_unwritable");
    const std::string dir = trace.path() + ".d";
    ASSERT_EQ(::mkdir(dir.c_str(), 0755), 0);
    ::setenv(ZLG_TRACE_FILE_ENV, dir.c_str(), 1);
    EXPECT_EQ(ZlgTraceMessageVarg("lost"), ZLG_ERR_WRITE_FAILED);
    ::rmdir(dir.c_str());
}

TEST(ZlgTrace, DefaultFileInTheWorkingDirectory) {
    const std::string dir = ::testing::TempDir() + "zlg_cwd_" + std::to_string(::getpid());
    ASSERT_EQ(::mkdir(dir.c_str(), 0755), 0);
    char old[4096];
    ASSERT_NE(::getcwd(old, sizeof old), nullptr);
    ::unsetenv(ZLG_TRACE_FILE_ENV);
    ASSERT_EQ(::chdir(dir.c_str()), 0);
    EXPECT_EQ(ZlgTraceMessageVarg("here"), ZLG_SUCCESS);
    ASSERT_EQ(::chdir(old), 0);
    std::ifstream in(dir + "/lineprobe_trace.log");
    std::string line;
    ASSERT_TRUE(std::getline(in, line));
    EXPECT_EQ(body(line), "-: here");
    ::unlink((dir + "/lineprobe_trace.log").c_str());
    ::rmdir(dir.c_str());
}

TEST(ZlgConcurrency, LinesFromManyThreadsNeverInterleave) {
    TraceFile trace("zlg_threads");
    constexpr int kThreads = 4;
    constexpr int kLines = 200;
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([t] {
            ZLG_HANDLE module = 0, label = 0;
            // Appended rather than "M" + std::to_string(t): GCC 12 at -O3 warns of an
            // overlapping memcpy inside the string insert that operator+ uses (-Wrestrict, a
            // false positive of that release).
            std::string name = "M";
            name += std::to_string(t);
            ZlgGetModuleHandle(name.c_str(), &module);
            ZlgGetLabelHandle("Error", &label);
            const std::string text(300, static_cast<char>('a' + t));
            for (int i = 0; i < kLines; ++i) {
                EXPECT_EQ(ZlgTraceNoClient(module, label, text.c_str()), ZLG_SUCCESS);
            }
        });
    }
    for (auto& t : threads) {
        t.join();
    }
    auto lines = trace.lines();
    ASSERT_EQ(lines.size(), static_cast<std::size_t>(kThreads * kLines));
    for (const auto& line : lines) {
        auto colon = line.find("/Error: ");
        ASSERT_NE(colon, std::string::npos) << line;
        const char who = line[colon - 1];  // the thread's module, M0..M3
        const std::string text = line.substr(colon + 8);
        EXPECT_EQ(text, std::string(300, static_cast<char>('a' + (who - '0')))) << line;
    }
}

}  // namespace
