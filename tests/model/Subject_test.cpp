#include "model/Subject.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "model/Aspect.h"
#include "model/Observer.h"

namespace {

using vx7diag::Aspect;
using vx7diag::Observer;
using vx7diag::Subject;

class CallState : public Aspect {};
class ChanState : public Aspect {
  public:
    explicit ChanState(int v = 0) : volume(v) {}
    int volume;
};

// Subjects key their observer sets on the aspect's class: the fields never take part, and
// two classes are never equal, each counting as less than the other.
TEST(Aspect, ComparesByClassOnly) {
    ChanState a(1);
    ChanState b(99);
    CallState other;
    Aspect& base = other;
    EXPECT_TRUE(a == b);
    EXPECT_FALSE(a < b);
    EXPECT_FALSE(a == base);
    EXPECT_TRUE(a < base);
    EXPECT_TRUE(base < a);
    EXPECT_EQ(other.ToZLG(), nullptr);
}

TEST(Observer, LessMeansAnotherObject) {
    Observer a;
    Observer b;
    EXPECT_TRUE(a < b);
    EXPECT_TRUE(b < a);
    EXPECT_FALSE(a < a);
}

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

// Copies of one RefPtr are one observer: it is added and told once; each observer hears only
// of its own aspect, in the order of the notifications.
TEST_F(SubjectTest, EachObserverIsToldOnceOfItsOwnAspect) {
    isa::RefPtr<Observer> copy = first;
    EXPECT_TRUE(subject.Attach(first, &callState));
    EXPECT_FALSE(subject.Attach(first, &callState));
    EXPECT_FALSE(subject.Attach(copy, &callState));
    subject.Attach(second, &chanState);
    subject.Notify(chanState);
    subject.Notify(callState);
    EXPECT_EQ(log, (std::vector<std::string>{"second:chan", "first:call"}));
}

// Detach answers how many observers the aspect keeps, -1 when it has none to detach from.
TEST_F(SubjectTest, DetachCountsWhatIsLeftOfTheAspect) {
    EXPECT_EQ(subject.Detach(first, callState), -1);
    subject.Attach(first, &chanState);
    EXPECT_EQ(subject.Detach(first, callState), -1);
    subject.Attach(first, &callState);
    subject.Attach(second, &callState);
    EXPECT_EQ(subject.Detach(first, callState), 1);
    EXPECT_EQ(subject.Detach(second, callState), 0);
    EXPECT_EQ(subject.Detach(second, callState), -1);
    subject.Notify(callState);
    // Detached from one aspect, the observer is still told of the other.
    subject.Notify(chanState);
    EXPECT_EQ(log, (std::vector<std::string>{"first:chan"}));
}

TEST_F(SubjectTest, ObserverLivesWhileInASet) {
    {
        isa::RefPtr<Observer> only(new Recorder("only", &log));
        subject.Attach(only, &callState);
    }
    subject.Notify(callState);
    EXPECT_EQ(log, (std::vector<std::string>{"only:call"}));
}

}  // namespace
