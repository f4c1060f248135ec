// The phone and the trunk view managers keep the same rules for their rows, their limit and
// their failures; one set of cases runs against both, on the board emulation of this process.
#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <iostream>
#include <map>
#include <string>
#include <vector>

#include "LogCapture.h"
#include "RecordingView.h"
#include "console/PhoneView.h"
#include "console/PhoneViewMgr.h"
#include "console/TrunkView.h"
#include "console/TrunkViewMgr.h"
#include "framework/tolk.h"
#include "model/BoardManager.h"
#include "platform/farm/ActiveFarm.h"
#include "sim/Builtin.h"

namespace lineprobe {
namespace {

using testing::RecordingView;

struct Key {
    unsigned int board, line, chan;
};

// The farm of 33 boards of four lines of 30 channels, played in this process; the phone
// manager's board list has one entry (40) without a manager behind it.
std::map<unsigned int, vx7diag::BoardManager*>& Boards() {
    static auto* boards = [] {
        setenv("VX7_FARM", LINEPROBE_FARMS_DIR "/big33.toml", 1);
        farm::resetActiveFarm();
        tolk::tolkInit();
        sim::startBuiltinEmulation();
        auto* map = new std::map<unsigned int, vx7diag::BoardManager*>();
        (*map)[1] = new vx7diag::BoardManager(1);
        (*map)[40] = nullptr;
        return map;
    }();
    return *boards;
}

class TestPhoneViewMgr : public PhoneViewMgr {
  public:
    explicit TestPhoneViewMgr(View* view) : PhoneViewMgr(view, Boards()) {}
};

class TestTrunkViewMgr : public TrunkViewMgr {
  public:
    explicit TestTrunkViewMgr(View* view) : TrunkViewMgr(view) { Boards(); }
};

struct Phones {
    using Manager = TestPhoneViewMgr;
    using ViewType = PhoneView;
    static constexpr int SUCCESS = PHONEVIEWMGR_SUCCESS;
    static constexpr int ALREADY = PHONEVIEWMGR_VIEW_ALREADY_CREATED;
    static constexpr int MAX = PHONEVIEWMGR_MAX_VIEWS_ALREADY_CREATED;
    static constexpr int ERROR = PHONEVIEWMGR_ERROR;
    static constexpr const char* HEAD =
        " B.L.C  CallId     ChanState                   CallState              Reason";
    // The channel's event subscription.
    static constexpr const char* SUBSCRIPTION = "18";

    // The i-th view of set s: sets keep the tests apart, since a stopped view keeps its
    // channel's registrations.
    static Key Good(unsigned int s, unsigned int i) { return {1, s, i + 1}; }
    // Line 65 and channel 32 are out of range, board 9 is not in the list, board 40 has no
    // manager, line 5 does not exist on board 1.
    static std::vector<Key> Bad() {
        return {{1, 65, 1}, {1, 1, 32}, {9, 1, 1}, {40, 1, 1}, {1, 5, 1}};
    }

    static PhoneView* Create(Manager& m, Key k, int& result) {
        return m.CreatePhoneView(k.board, k.line, k.chan, result);
    }
    static int Destroy(Manager& m, Key k) { return m.DestroyPhoneView(k.board, k.line, k.chan); }
    static int DestroyAll(Manager& m) { return m.DestroyAllPhoneViews(); }
    static PhoneView* Find(Manager& m, Key k) { return m.FindPhoneView(k.board, k.line, k.chan); }
    static std::string Label(Key k) { return PhoneViewMgr::MakeKey(k.board, k.line, k.chan); }
    static std::string Named(Key k) { return "phone view " + Label(k); }
};

struct Trunks {
    using Manager = TestTrunkViewMgr;
    using ViewType = TrunkView;
    static constexpr int SUCCESS = TRUNKVIEWMGR_SUCCESS;
    static constexpr int ALREADY = TRUNKVIEWMGR_VIEW_ALREADY_CREATED;
    static constexpr int MAX = TRUNKVIEWMGR_MAX_VIEWS_ALREADY_CREATED;
    static constexpr int ERROR = TRUNKVIEWMGR_ERROR;
    static constexpr const char* HEAD =
        " B.L    TrunkState        Reason          Sig   LBK   Red   Yel   CRC   AIS   DChan  "
        "BPVS   FERR";
    static constexpr const char* SUBSCRIPTION = "16";

    static Key Good(unsigned int s, unsigned int i) { return {i, s, 0}; }
    // Line 5 and line 0 do not exist; board 40 is not in the farm and stays silent, so its
    // one try costs the whole reply time.
    static std::vector<Key> Bad() { return {{1, 5, 0}, {1, 0, 0}, {40, 1, 0}}; }

    static TrunkView* Create(Manager& m, Key k, int& result) {
        return m.CreateTrunkView(k.board, k.line, result);
    }
    static int Destroy(Manager& m, Key k) { return m.DestroyTrunkView(k.board, k.line); }
    static int DestroyAll(Manager& m) { return m.DestroyAllTrunkViews(); }
    static TrunkView* Find(Manager& m, Key k) { return m.FindTrunkView(k.board, k.line); }
    static std::string Label(Key k) { return TrunkViewMgr::MakeKey(k.board, k.line); }
    static std::string Named(Key k) { return "trunk view " + Label(k); }
};

template <class Side>
class ViewMgrTest : public ::testing::Test {
  protected:
    // Each view is destroyed one by one, which frees it and its registrations for later tests.
    ~ViewMgrTest() override {
        for (const Key& k : opened) {
            Side::Destroy(manager, k);
        }
    }

    // Creates and starts a view as the view command does.
    int Open(Key k) {
        int result = 99;
        auto* view = Side::Create(manager, k, result);
        EXPECT_EQ(view != nullptr, result == Side::SUCCESS || result == Side::ALREADY);
        if (result == Side::SUCCESS && view != nullptr) {
            opened.push_back(k);
            view->Start();
        }
        return result;
    }

    // The row that shows the view's label, or -1.
    int LabelRow(Key k) {
        const std::string label = Side::Label(k);
        for (int row = 1; row < 11; ++row) {
            if (screen.At(row, 1, label.size() + 1) == label + " ") {
                return row;
            }
        }
        return -1;
    }

    RecordingView screen{11, 100};
    typename Side::Manager manager{&screen};
    std::vector<Key> opened;
};

using Sides = ::testing::Types<Phones, Trunks>;
TYPED_TEST_SUITE(ViewMgrTest, Sides);

TYPED_TEST(ViewMgrTest, LowestFreeRowUnderTheHeadIsTakenAndAClosedRowIsGivenBack) {
    const std::string head = TypeParam::HEAD;
    EXPECT_EQ(this->screen.Row(0).substr(0, head.size()), head);
    auto key = [](unsigned int i) { return TypeParam::Good(1, i); };
    for (unsigned int i = 0; i < 3; ++i) {
        ASSERT_EQ(this->Open(key(i)), TypeParam::SUCCESS);
    }
    EXPECT_EQ(this->LabelRow(key(0)), 1);
    EXPECT_EQ(this->LabelRow(key(2)), 3);

    int result = 0;
    auto* again = TypeParam::Create(this->manager, key(1), result);
    EXPECT_EQ(result, TypeParam::ALREADY);
    EXPECT_EQ(again, TypeParam::Find(this->manager, key(1)));
    EXPECT_EQ(this->manager.ViewCount(), 3u);

    ASSERT_EQ(TypeParam::Destroy(this->manager, key(0)), TypeParam::SUCCESS);
    EXPECT_EQ(this->screen.Row(1), std::string(100, ' '));
    EXPECT_EQ(TypeParam::Find(this->manager, key(0)), nullptr);

    // An unknown key touches no row.
    const std::size_t before = this->screen.calls.size();
    EXPECT_EQ(TypeParam::Destroy(this->manager, key(0)), TypeParam::ERROR);
    EXPECT_EQ(TypeParam::Destroy(this->manager, TypeParam::Good(1, 20)), TypeParam::ERROR);
    EXPECT_EQ(this->screen.calls.size(), before);

    ASSERT_EQ(this->Open(key(5)), TypeParam::SUCCESS);
    EXPECT_EQ(this->LabelRow(key(5)), 1);
}

// Failed creations never use the rows up; the limit of ten is tested before the key.
TYPED_TEST(ViewMgrTest, FailedCreationsTakeNoRowAndTheLimitOfTenComesFirst) {
    for (const Key& bad : TypeParam::Bad()) {
        EXPECT_EQ(this->Open(bad), TypeParam::ERROR) << TypeParam::Label(bad);
    }
    EXPECT_EQ(this->manager.ViewCount(), 0u);
    auto key = [](unsigned int i) { return TypeParam::Good(2, i); };
    for (unsigned int i = 0; i < 10; ++i) {
        ASSERT_EQ(this->Open(key(i)), TypeParam::SUCCESS) << i;
    }
    EXPECT_EQ(this->LabelRow(key(0)), 1);
    EXPECT_EQ(this->LabelRow(key(9)), 10);
    int result = 0;
    EXPECT_EQ(TypeParam::Create(this->manager, key(10), result), nullptr);
    EXPECT_EQ(result, TypeParam::MAX);
    EXPECT_EQ(TypeParam::Create(this->manager, key(2), result), nullptr);
    EXPECT_EQ(result, TypeParam::MAX);

    ASSERT_EQ(TypeParam::Destroy(this->manager, key(3)), TypeParam::SUCCESS);
    ASSERT_EQ(this->Open(key(10)), TypeParam::SUCCESS);
    EXPECT_EQ(this->LabelRow(key(10)), 4);
}

TYPED_TEST(ViewMgrTest, DestroyAllStopsEveryViewAndLeavesTheRows) {
    EXPECT_EQ(TypeParam::DestroyAll(this->manager), 1);
    // The stopped views stay allocated, as at the end of the process, and keep their
    // channels: a set of their own.
    std::vector<typename TypeParam::ViewType*> left;
    for (unsigned int i = 0; i < 3; ++i) {
        ASSERT_EQ(this->Open(TypeParam::Good(3, i)), TypeParam::SUCCESS);
        left.push_back(TypeParam::Find(this->manager, TypeParam::Good(3, i)));
    }
    this->opened.clear();
    const std::size_t before = this->screen.calls.size();
    EXPECT_EQ(TypeParam::DestroyAll(this->manager), 1);
    EXPECT_EQ(this->manager.ViewCount(), 0u);
    EXPECT_EQ(TypeParam::Find(this->manager, TypeParam::Good(3, 0)), nullptr);
    for (std::size_t i = before; i < this->screen.calls.size(); ++i) {
        EXPECT_NE(this->screen.calls[i].what, "clear");
    }
    EXPECT_EQ(this->LabelRow(TypeParam::Good(3, 1)), 2);
    for (auto* stopped : left) {
        delete stopped;
    }
}

TYPED_TEST(ViewMgrTest, ViewWhoseSubscriptionFailedSaysSoInTheErrorLog) {
    const Key refused = TypeParam::Good(4, 3);
    const Key fine = TypeParam::Good(4, 4);
    std::string failed;
    {
        testsupport::LogCapture err(std::cerr);
        // The view is made and drawn all the same.
        sim::builtinControl(std::string("refuse ") + TypeParam::SUBSCRIPTION);
        EXPECT_EQ(this->Open(refused), TypeParam::SUCCESS);
        sim::builtinControl(std::string("normal ") + TypeParam::SUBSCRIPTION);
        failed = err.Text();
    }
    EXPECT_EQ(this->LabelRow(refused), 1);
    EXPECT_NE(failed.find(TypeParam::Named(refused) +
                          ": subscription to the board's events failed, the view will not "
                          "follow the board"),
              std::string::npos)
        << failed;

    testsupport::LogCapture err(std::cerr);
    EXPECT_EQ(this->Open(fine), TypeParam::SUCCESS);
    EXPECT_EQ(err.Text(), "");
}

TEST(TrunkViewMgr, StartDrawsLabelThenTheStatusOfTheLine) {
    RecordingView screen{11, 100};
    TestTrunkViewMgr manager(&screen);
    int result = 0;
    TrunkView* view = manager.CreateTrunkView(3, 2, result);
    ASSERT_EQ(result, TRUNKVIEWMGR_SUCCESS);
    view->Start();
    const auto prints = screen.Prints();
    auto first = [&](auto drawn) {
        return std::find_if(prints.begin(), prints.end(), drawn) - prints.begin();
    };
    const auto label = first([](const auto& p) { return p.row == 1 && p.text == "3.2"; });
    const auto state = first([](const auto& p) { return p.row == 1 && p.col == 8; });
    ASSERT_LT(state, std::ssize(prints));
    EXPECT_LT(label, state);
    // The observer's own counts start at 0.
    EXPECT_EQ(screen.At(1, 85, 2), "0 ");
    EXPECT_EQ(screen.At(1, 92, 2), "0 ");
    manager.DestroyTrunkView(3, 2);
}

TEST(ViewKeys, HoldAnyNumbersAsSignedDecimals) {
    EXPECT_EQ(PhoneViewMgr::MakeKey(1, 1, 23), "1.1.23");
    EXPECT_EQ(PhoneViewMgr::MakeKey(10, 2, 3), "10.2.3");
    EXPECT_EQ(PhoneViewMgr::MakeKey(static_cast<unsigned int>(-1), 1, 1), "-1.1.1");
    EXPECT_EQ(PhoneViewMgr::MakeKey(UINT_MAX / 2, 2147483648u, 2147483648u),
              "2147483647.-2147483648.-2147483648");
    EXPECT_EQ(TrunkViewMgr::MakeKey(1, 2), "1.2");
    EXPECT_EQ(TrunkViewMgr::MakeKey(4294967295u, 2147483648u), "-1.-2147483648");
}

}  // namespace
}  // namespace lineprobe
