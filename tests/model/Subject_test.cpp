#include "model/Subject.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "model/Observer.h"

namespace {

using vx7diag::Aspect;
using vx7diag::Observer;
using vx7diag::Subject;

class CallState : public Aspect {};
class ChanState : public Aspect {};

// Records, into a log shared by all observers of a test, who was told of what.
class Recorder : public Observer {
  public:
    Recorder(std::string n, std::vector<std::string>* l) : name(std::move(n)), log(l) {}
    void Update(Subject*, Aspect& aspect) override {
        log->push_back(name + (dynamic_cast<CallState*>(&aspect) != nullptr ? ":call" : ":chan"));
    }
    std::string name;
    std::vector<std::string>* log;
};

class SubjectTest : public ::testing::Test {
  protected:
    std::vector<std::string> log;
    isa::RefPtr<Observer> first{new Recorder("first", &log)};
    isa::RefPtr<Observer> second{new Recorder("second", &log)};
    CallState callState;
    ChanState chanState;
    Subject subject;
};

TEST_F(SubjectTest, SameObserverTwiceIsAddedOnce) {
    EXPECT_TRUE(subject.Attach(first, &callState));
    EXPECT_FALSE(subject.Attach(first, &callState));
    subject.Notify(callState);
    EXPECT_EQ(log, (std::vector<std::string>{"first:call"}));
}

TEST_F(SubjectTest, CopiesOfOneRefPtrAreOneObserver) {
    isa::RefPtr<Observer> copy = first;
    EXPECT_TRUE(subject.Attach(first, &callState));
    EXPECT_FALSE(subject.Attach(copy, &callState));
    EXPECT_EQ(subject.Detach(copy, callState), 0);
}

TEST_F(SubjectTest, DetachOfUnknownAspectGivesMinusOne) {
    EXPECT_EQ(subject.Detach(first, callState), -1);
    subject.Attach(first, &chanState);
    EXPECT_EQ(subject.Detach(first, callState), -1);
}

TEST_F(SubjectTest, LastDetachRemovesTheAspect) {
    subject.Attach(first, &callState);
    EXPECT_EQ(subject.Detach(first, callState), 0);
    EXPECT_EQ(subject.Detach(first, callState), -1);
    subject.Notify(callState);
    EXPECT_TRUE(log.empty());
}

TEST_F(SubjectTest, DetachOfOneOfTwoLeavesTheOther) {
    subject.Attach(first, &callState);
    subject.Attach(second, &callState);
    EXPECT_EQ(subject.Detach(first, callState), 1);
    subject.Notify(callState);
    EXPECT_EQ(log, (std::vector<std::string>{"second:call"}));
}

TEST_F(SubjectTest, NotifyReachesOnlyObserversOfThatAspect) {
    subject.Attach(first, &callState);
    subject.Attach(second, &chanState);
    subject.Notify(chanState);
    subject.Notify(callState);
    EXPECT_EQ(log, (std::vector<std::string>{"second:chan", "first:call"}));
}

TEST_F(SubjectTest, DetachForAnotherAspectKeepsTheObserver) {
    subject.Attach(first, &callState);
    subject.Attach(first, &chanState);
    EXPECT_EQ(subject.Detach(first, chanState), 0);
    subject.Notify(callState);
    EXPECT_EQ(log, (std::vector<std::string>{"first:call"}));
}

TEST_F(SubjectTest, ObserverLivesWhileInASet) {
    std::vector<std::string> own;
    {
        isa::RefPtr<Observer> only(new Recorder("only", &own));
        subject.Attach(only, &callState);
    }
    subject.Notify(callState);
    EXPECT_EQ(own, (std::vector<std::string>{"only:call"}));
}

TEST(Observer, LessMeansAnotherObject) {
    Observer a;
    Observer b;
    EXPECT_TRUE(a < b);
    EXPECT_TRUE(b < a);
    EXPECT_FALSE(a < a);
}

}  // namespace
