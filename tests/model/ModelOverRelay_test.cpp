// The model against vx7sim over the relay transport: the same operations as against the
// built-in emulation, with the boards on the other side of a TCP connection.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>

#include "RecordingObserver.h"
#include "SimFixture.h"
#include "model/AllAlarms.h"
#include "model/BoardManager.h"
#include "model/Phone.h"
#include "model/Trunk.h"
#include "model/VX7EventPublisher.h"

#ifndef LINEPROBE_VX7SIM
#error "LINEPROBE_VX7SIM must name the vx7sim binary"
#endif

namespace {

using namespace vx7diag;

// vx7sim on a free port, driven through its standard input.
class Relay {
  public:
    Relay() {
        int in[2];
        int out[2];
        if (pipe(in) != 0 || pipe(out) != 0) {
            return;
        }
        pid = fork();
        if (pid == 0) {
            dup2(in[0], 0);
            dup2(out[1], 1);
            close(in[1]);
            close(out[0]);
            execl(LINEPROBE_VX7SIM, "vx7sim", "--port", "0", static_cast<char*>(nullptr));
            _exit(127);
        }
        close(in[0]);
        close(out[1]);
        control = fdopen(in[1], "w");
        replies = fdopen(out[0], "r");
        std::string first = ReadLine();
        if (first.rfind("listening on ", 0) == 0) {
            port = std::stoi(first.substr(13));
        }
    }
    ~Relay() {
        if (control != nullptr) {
            std::fputs("quit\n", control);
            std::fclose(control);
        }
        if (pid > 0) {
            int status = 0;
            for (int i = 0; i < 200 && waitpid(pid, &status, WNOHANG) == 0; ++i) {
                usleep(10000);
            }
            kill(pid, SIGKILL);
            waitpid(pid, &status, 0);
        }
        if (replies != nullptr) {
            std::fclose(replies);
        }
    }
    std::string ReadLine() {
        char line[512];
        if (replies == nullptr || std::fgets(line, sizeof line, replies) == nullptr) {
            return "";
        }
        std::string text(line);
        while (!text.empty() && (text.back() == '\n' || text.back() == '\r')) {
            text.pop_back();
        }
        return text;
    }
    // One control line; the answer is the next line that is one ("ok ..." or "error: ...").
    std::string Control(const std::string& line) {
        std::fputs((line + "\n").c_str(), control);
        std::fflush(control);
        for (;;) {
            std::string reply = ReadLine();
            if (reply.empty() || reply.rfind("ok", 0) == 0 || reply.rfind("error", 0) == 0) {
                return reply;
            }
        }
    }
    int port = 0;

  private:
    pid_t pid = -1;
    FILE* control = nullptr;
    FILE* replies = nullptr;
};

class ModelOverRelay : public ::testing::Test {
  protected:
    void SetUp() override {
        ASSERT_NE(relay.port, 0);
        unsetenv("HOST");
        setenv("REMOTE_TKHOST", ("127.0.0.1:" + std::to_string(relay.port)).c_str(), 1);
    }
    void TearDown() override { unsetenv("REMOTE_TKHOST"); }
    Relay relay;
};

TEST_F(ModelOverRelay, DiscoveryCallsLinesAndEvents) {
    // The device map stays on this host; only the boards are behind the relay.
    SimFixture::UseFarm("");
    BoardManager manager(1);
    EXPECT_EQ(manager.GetBoardType(), BoardManager::DIGITAL_BOARD);
    EXPECT_EQ(manager.GetSignalingType(2), 4);

    Phone phone(&manager, 1, 9);
    unsigned int callId = phone.MakeCall("5551220", "5551221");
    EXPECT_NE(callId, 0u);
    EXPECT_EQ(phone.DropCall(callId), 0);

    Trunk trunk(1, 2);
    trunk.EnableLoopBack(2);
    EXPECT_EQ(trunk.GetLoopBackMode(), 2);
    trunk.DisableLoopBack();

    static AllAlarms alarms;
    VX7EventPublisher publisher(1, 2, 1);
    isa::RefPtr<Observer> watcher(new RecordingObserver);
    ASSERT_TRUE(publisher.Attach(watcher, &alarms));
    EXPECT_EQ(relay.Control("alarm 1 2 yellow on").rfind("ok", 0), 0u);
    EXPECT_EQ(static_cast<RecordingObserver*>(watcher.Get())->WaitFor("Alarm Event:"),
              "Alarm Event:  board=1 trunk=2 type=Yellow state=Active");
    relay.Control("alarm 1 2 yellow off");
    EXPECT_EQ(publisher.Detach(watcher, alarms), 0);

    relay.Control("refuse 1214");
    EXPECT_EQ(phone.MakeCall("5551220", "5551221"), 0u);
}

}  // namespace
