#pragma once

#include <map>

#include "model/Subject.h"
#include "model/VX7EventPublication.h"
#include "transport/IsaSync.h"

namespace tolk {
class Addressable;
class CAS;
class CHP;
class Cluster;
class LCON;
class TSC;
}  // namespace tolk

namespace vx7diag {

class VX7EventPublisher;

// For each component object a publisher made, that publisher: the event callbacks find their way
// back through it. Reach it only through the functions below, which lock it.
extern std::map<tolk::Addressable*, VX7EventPublisher*> g_publishers;

// The subject for one channel or one trunk. It holds the board's event subscriptions only while
// someone watches: the first observer of an aspect subscribes it, the last one cancels it.
//
// Two locks. `lock` serialises Attach, Detach and the destructor, and is held across their
// blocking requests to the board. `observersLock` guards only the observer map and is what Notify
// takes, so that an event arriving while a subscription request waits for its answer is not held
// up behind that request (the answer comes on the same reader thread that delivers the event).
// Order: publication lock, then publisher lock(s), then the observer's own lock.
class VX7EventPublisher : public Subject {
  public:
    static constexpr int CAS_COMPONENT = 0;
    static constexpr int CHP_COMPONENT = 1;
    static constexpr int LCON_COMPONENT = 2;
    static constexpr int TSC_COMPONENT = 3;

    VX7EventPublisher(unsigned int board, unsigned int trunk, unsigned int channel);
    ~VX7EventPublisher() override;

    // True when the observer now watches the aspect with the board reporting its events. Every
    // failure a board can cause (refusal, silence, absence of the cluster or component) gives
    // false, with the reason in the log, and leaves the observer out.
    bool Attach(isa::RefPtr<Observer> observer, Aspect* aspect) override;
    // Observers of the aspect left; 0 also for an aspect that was not watched.
    int Detach(const isa::RefPtr<Observer>& observer, const Aspect& aspect) override;
    void Notify(Aspect& aspect) override;

    virtual void GetChannel(unsigned int& board, unsigned int& trunk, unsigned int& channel);
    virtual bool Start(Aspect* aspect);
    virtual void Stop(const Aspect& aspect);
    virtual bool Subscribe(VX7EventPublication* publication);
    virtual void Unsubscribe(VX7EventPublication* publication);
    // After the relay connection came back: the board knows nothing of the subscriptions made
    // from the lost connection's address, so every watched aspect asks for its events again.
    // False when a board refused or did not answer (the reason is in the log).
    bool Resubscribe();

    // Null when the component is not (or no longer) one that a live publisher made.
    static VX7EventPublisher* GetMyPublisher(tolk::Addressable* component);

    // Read-only views for tests and diagnostics.
    tolk::Cluster* GetTscCluster() const { return tscCluster; }
    tolk::Cluster* GetLconCluster() const { return lconCluster; }
    tolk::CAS* GetCas() const { return cas; }
    tolk::CHP* GetChp() const { return chp; }
    tolk::LCON* GetLcon() const { return lcon; }
    tolk::TSC* GetTsc() const { return tsc; }
    unsigned int GetCount(int component) const;
    int ObserverCount(const Aspect& aspect);

  private:
    void SetPublisher(tolk::Addressable* component);
    void ForgetPublisher(tolk::Addressable* component);
    void DeleteClusters();
    void ReleaseComponents();

    unsigned int board;
    unsigned int trunk;
    unsigned int channel;
    tolk::Cluster* tscCluster = nullptr;
    tolk::Cluster* lconCluster = nullptr;
    tolk::CAS* cas = nullptr;
    tolk::CHP* chp = nullptr;
    tolk::LCON* lcon = nullptr;
    tolk::TSC* tsc = nullptr;
    unsigned int casCount = 0;
    unsigned int chpCount = 0;
    unsigned int lconCount = 0;
    unsigned int tscCount = 0;
    isa::CriticalSection lock;
    isa::CriticalSection observersLock;
};

}  // namespace vx7diag
