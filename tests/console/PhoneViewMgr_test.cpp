#include "console/PhoneViewMgr.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstdlib>
#include <iostream>
#include <map>
#include <sstream>
#include <string>
#include <tuple>
#include <vector>

#include "RecordingView.h"
#include "console/PhoneView.h"
#include "framework/tolk.h"
#include "model/BoardManager.h"
#include "platform/farm/ActiveFarm.h"
#include "sim/Builtin.h"

namespace lineprobe {
namespace {

using testing::RecordingView;

// The farm of 33 boards of four lines of 30 channels, played in this process (the same
// as for the trunk view tests, since the emulation starts once per process).
std::map<unsigned int, vx7diag::BoardManager*>& Boards() {
    static auto* boards = [] {
        setenv("VX7_FARM", LINEPROBE_FARMS_DIR "/big33.toml", 1);
        farm::resetActiveFarm();
        tolk::tolkInit();
        sim::startBuiltinEmulation();
        auto* map = new std::map<unsigned int, vx7diag::BoardManager*>();
        (*map)[1] = new vx7diag::BoardManager(1);
        // A board number with a list entry but no manager behind it.
        (*map)[40] = nullptr;
        return map;
    }();
    return *boards;
}

class TestPhoneViewMgr : public PhoneViewMgr {
  public:
    explicit TestPhoneViewMgr(View* view) : PhoneViewMgr(view, Boards()) {}
};

class PhoneViewMgrTest : public ::testing::Test {
  protected:
    PhoneViewMgrTest() : manager(&view) {}
    // Each view is destroyed one by one, which frees it: a view that DestroyAll only
    // stops keeps its channel's registrations, and a later test could not open it again.
    ~PhoneViewMgrTest() override {
        for (const auto& [board, line, chan] : opened) {
            manager.DestroyPhoneView(board, line, chan);
        }
    }

    // Creates and starts a view as the phone command does; its row is where the label lands.
    int Open(unsigned int board, unsigned int line, unsigned int chan) {
        int result = 99;
        PhoneView* phoneView = manager.CreatePhoneView(board, line, chan, result);
        if (result == PHONEVIEWMGR_SUCCESS) {
            EXPECT_NE(phoneView, nullptr);
            opened.push_back({board, line, chan});
            phoneView->Start();
        } else {
            EXPECT_EQ(result == PHONEVIEWMGR_VIEW_ALREADY_CREATED, phoneView != nullptr);
        }
        return result;
    }

    int LabelRow(const std::string& label) {
        for (int row = 1; row < 11; ++row) {
            if (view.At(row, 1, label.size() + 1) == label + " ") {
                return row;
            }
        }
        return -1;
    }

    RecordingView view{11, 100};
    TestPhoneViewMgr manager;
    std::vector<std::tuple<unsigned int, unsigned int, unsigned int>> opened;
};

TEST_F(PhoneViewMgrTest, HeadIsDrawnOnRowZero) {
    EXPECT_EQ(view.Row(0).substr(0, 76),
              " B.L.C  CallId     ChanState                   CallState              Reason");
}

TEST_F(PhoneViewMgrTest, LowestFreeRowIsTaken) {
    ASSERT_EQ(Open(1, 1, 1), PHONEVIEWMGR_SUCCESS);
    ASSERT_EQ(Open(1, 1, 2), PHONEVIEWMGR_SUCCESS);
    ASSERT_EQ(Open(1, 1, 3), PHONEVIEWMGR_SUCCESS);
    EXPECT_EQ(LabelRow("1.1.1"), 1);
    EXPECT_EQ(LabelRow("1.1.3"), 3);

    ASSERT_EQ(manager.DestroyPhoneView(1, 1, 1), PHONEVIEWMGR_SUCCESS);
    EXPECT_EQ(view.Row(1), std::string(100, ' '));
    EXPECT_EQ(view.calls.back().what, "clear");
    EXPECT_EQ(view.calls.back().row, 1);
    EXPECT_EQ(view.calls.back().col, 1);
    EXPECT_EQ(manager.FindPhoneView(1, 1, 1), nullptr);

    ASSERT_EQ(Open(1, 2, 5), PHONEVIEWMGR_SUCCESS);
    EXPECT_EQ(LabelRow("1.2.5"), 1);
}

TEST_F(PhoneViewMgrTest, SecondCreateReturnsTheOpenView) {
    int result = 0;
    PhoneView* first = manager.CreatePhoneView(1, 1, 4, result);
    ASSERT_EQ(result, PHONEVIEWMGR_SUCCESS);
    opened.push_back({1, 1, 4});
    PhoneView* second = manager.CreatePhoneView(1, 1, 4, result);
    EXPECT_EQ(result, PHONEVIEWMGR_VIEW_ALREADY_CREATED);
    EXPECT_EQ(second, first);
    EXPECT_EQ(manager.FindPhoneView(1, 1, 4), first);
    EXPECT_EQ(manager.ViewCount(), 1u);
}

TEST_F(PhoneViewMgrTest, FailedCreationsNeverUseTheRowsUp) {
    // Line 65 and channel 32 are out of range, board 9 is not in the list, board 40 has
    // no manager, line 5 does not exist on board 1.
    for (int round = 0; round < 3; ++round) {
        EXPECT_EQ(Open(1, 65, 1), PHONEVIEWMGR_ERROR);
        EXPECT_EQ(Open(1, 1, 32), PHONEVIEWMGR_ERROR);
        EXPECT_EQ(Open(9, 1, 1), PHONEVIEWMGR_ERROR);
        EXPECT_EQ(Open(40, 1, 1), PHONEVIEWMGR_ERROR);
        EXPECT_EQ(Open(1, 5, 1), PHONEVIEWMGR_ERROR);
    }
    EXPECT_EQ(manager.ViewCount(), 0u);
    for (unsigned int chan = 1; chan <= 10; ++chan) {
        ASSERT_EQ(Open(1, 1, chan), PHONEVIEWMGR_SUCCESS) << chan;
    }
    EXPECT_EQ(LabelRow("1.1.1"), 1);
    EXPECT_EQ(LabelRow("1.1.10"), 10);
}

TEST_F(PhoneViewMgrTest, LimitOfTenIsTestedBeforeTheKey) {
    for (unsigned int chan = 1; chan <= 10; ++chan) {
        ASSERT_EQ(Open(1, 2, chan), PHONEVIEWMGR_SUCCESS);
    }
    int result = 0;
    EXPECT_EQ(manager.CreatePhoneView(1, 2, 11, result), nullptr);
    EXPECT_EQ(result, PHONEVIEWMGR_MAX_VIEWS_ALREADY_CREATED);
    EXPECT_EQ(manager.CreatePhoneView(1, 2, 3, result), nullptr);
    EXPECT_EQ(result, PHONEVIEWMGR_MAX_VIEWS_ALREADY_CREATED);

    ASSERT_EQ(manager.DestroyPhoneView(1, 2, 4), PHONEVIEWMGR_SUCCESS);
    ASSERT_EQ(Open(1, 2, 11), PHONEVIEWMGR_SUCCESS);
    EXPECT_EQ(LabelRow("1.2.11"), 4);
}

TEST_F(PhoneViewMgrTest, DestroyOfAnUnknownKeyTouchesNoRow) {
    ASSERT_EQ(Open(1, 1, 1), PHONEVIEWMGR_SUCCESS);
    const std::size_t before = view.calls.size();
    EXPECT_EQ(manager.DestroyPhoneView(1, 1, 2), PHONEVIEWMGR_ERROR);
    EXPECT_EQ(manager.DestroyPhoneView(static_cast<unsigned int>(-1), 1, 1), PHONEVIEWMGR_ERROR);
    EXPECT_EQ(view.calls.size(), before);
    EXPECT_NE(manager.FindPhoneView(1, 1, 1), nullptr);
}

TEST_F(PhoneViewMgrTest, DestroyAllStopsEveryViewAndLeavesTheRows) {
    EXPECT_EQ(manager.DestroyAllPhoneViews(), 1);
    // Channels of their own: the stopped views stay allocated, as at the end of the
    // process, and keep their channels.
    ASSERT_EQ(Open(1, 3, 2), PHONEVIEWMGR_SUCCESS);
    ASSERT_EQ(Open(1, 3, 10), PHONEVIEWMGR_SUCCESS);
    ASSERT_EQ(Open(1, 4, 1), PHONEVIEWMGR_SUCCESS);
    std::vector<PhoneView*> left = {manager.FindPhoneView(1, 3, 2), manager.FindPhoneView(1, 3, 10),
                                    manager.FindPhoneView(1, 4, 1)};
    const std::size_t before = view.calls.size();
    EXPECT_EQ(manager.DestroyAllPhoneViews(), 1);
    EXPECT_EQ(manager.ViewCount(), 0u);
    EXPECT_EQ(manager.FindPhoneView(1, 3, 2), nullptr);
    for (std::size_t i = before; i < view.calls.size(); ++i) {
        EXPECT_NE(view.calls[i].what, "clear");
    }
    EXPECT_EQ(LabelRow("1.3.10"), 2);
    // What the process would leave behind at its end, the test frees.
    for (PhoneView* stopped : left) {
        delete stopped;
    }
}

// What is written to std::cerr, the error log, while it lives.
class ErrLog {
  public:
    ErrLog() : saved(std::cerr.rdbuf(text.rdbuf())) {}
    ~ErrLog() { std::cerr.rdbuf(saved); }
    std::string Text() const { return text.str(); }

  private:
    std::ostringstream text;
    std::streambuf* saved;
};

TEST_F(PhoneViewMgrTest, ViewWhoseSubscriptionFailedSaysSoInTheErrorLog) {
    // The channel's event subscription is refused; the view is made and drawn all the same.
    sim::builtinControl("refuse 18");
    std::string failed;
    {
        ErrLog err;
        EXPECT_EQ(Open(1, 1, 4), PHONEVIEWMGR_SUCCESS);
        failed = err.Text();
    }
    sim::builtinControl("normal 18");
    EXPECT_EQ(LabelRow("1.1.4"), 1);
    EXPECT_NE(failed.find("1.1.4"), std::string::npos) << failed;
    EXPECT_NE(failed.find("will not follow the board"), std::string::npos) << failed;

    ErrLog err;
    EXPECT_EQ(Open(1, 1, 5), PHONEVIEWMGR_SUCCESS);
    EXPECT_EQ(err.Text(), "");
}

struct KeyCase {
    unsigned int board, line, chan;
    std::string key;
};

class PhoneKeyTest : public ::testing::TestWithParam<KeyCase> {};

TEST_P(PhoneKeyTest, KeyHoldsAnyThreeNumbersAsSignedDecimals) {
    EXPECT_EQ(PhoneViewMgr::MakeKey(GetParam().board, GetParam().line, GetParam().chan),
              GetParam().key);
}

INSTANTIATE_TEST_SUITE_P(Keys, PhoneKeyTest,
                         ::testing::Values(KeyCase{1, 1, 23, "1.1.23"}, KeyCase{10, 2, 3, "10.2.3"},
                                           KeyCase{static_cast<unsigned int>(-1), 1, 1, "-1.1.1"},
                                           KeyCase{UINT_MAX / 2, 2147483648u, 2147483648u,
                                                   "2147483647.-2147483648.-2147483648"}),
                         [](const ::testing::TestParamInfo<KeyCase>& info) {
                             return "Case" + std::to_string(info.index);
                         });

}  // namespace
}  // namespace lineprobe
