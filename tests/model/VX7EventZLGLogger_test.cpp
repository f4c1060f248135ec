#include "model/VX7EventZLGLogger.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "model/Aspect.h"
#include "platform/zlg/zlg.h"

namespace {

// An aspect in the middle of an event: it has a text, built once.
class Carrying : public vx7diag::Aspect {
  public:
    explicit Carrying(const char* text) {
        zlgText = new char[64];
        std::snprintf(zlgText, 64, "%s", text);
    }
    char* ToZLG() override { return zlgText; }
};

std::vector<std::string> ReadLines(const std::string& path) {
    std::ifstream in(path);
    std::vector<std::string> lines;
    for (std::string line; std::getline(in, line);) {
        lines.push_back(line);
    }
    return lines;
}

bool EndsWith(const std::string& s, const std::string& tail) {
    return s.size() >= tail.size() && s.compare(s.size() - tail.size(), tail.size(), tail) == 0;
}

class TraceFile : public ::testing::Test {
  protected:
    void SetUp() override {
        char name[] = "/tmp/model_zlg_XXXXXX";
        int fd = mkstemp(name);
        ASSERT_GE(fd, 0);
        close(fd);
        path = name;
        setenv(ZLG_TRACE_FILE_ENV, path.c_str(), 1);
    }
    void TearDown() override {
        unsetenv(ZLG_TRACE_FILE_ENV);
        unlink(path.c_str());
    }
    std::string path;
};

// An aspect without a text (never a publication during an event) is traced as an empty line.
TEST_F(TraceFile, EachEventGoesToStandardOutputAndTheTraceAlike) {
    vx7diag::VX7EventZLGLogger logger;
    Carrying event("Call State timestamp=7 board=1 trunk=1 channel=3 state=Alerting");
    vx7diag::Aspect textless;

    testing::internal::CaptureStdout();
    logger.Update(nullptr, event);
    logger.Update(nullptr, textless);
    std::string out = testing::internal::GetCapturedStdout();

    EXPECT_EQ(out,
              "trace:: Call State timestamp=7 board=1 trunk=1 channel=3 state=Alerting\n"
              "trace:: \n");
    std::vector<std::string> lines = ReadLines(path);
    ASSERT_EQ(lines.size(), 2u);
    EXPECT_TRUE(EndsWith(
        lines[0], " Ocelot/Error: Call State timestamp=7 board=1 trunk=1 channel=3 state=Alerting"))
        << lines[0];
    EXPECT_TRUE(EndsWith(lines[1], " Ocelot/Error: ")) << lines[1];
}

// The trace library's name tables are process-wide, so the failure is provoked in a freshly
// started child, where "Ocelot" has not been registered by an earlier test.
TEST_F(TraceFile, FailedModuleHandleIsTracedAndTheLabelStillAskedFor) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    std::string tracePath = path;
    EXPECT_EXIT(
        {
            for (int i = 0; i < ZLG_MAX_NAMES; ++i) {
                ZLG_HANDLE h;
                ZlgGetModuleHandle(("filler" + std::to_string(i)).c_str(), &h);
            }
            vx7diag::VX7EventZLGLogger logger;
            std::vector<std::string> lines = ReadLines(tracePath);
            bool ok = lines.size() == 1 &&
                      EndsWith(lines[0], " -: Unable to retrieve module handle, ZlgRet = 2") &&
                      logger.GetLabelHandle() != 0 && logger.GetModuleHandle() == 0;
            std::exit(ok ? 0 : 1);
        },
        ::testing::ExitedWithCode(0), "");
}

}  // namespace
