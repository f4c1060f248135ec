#include "model/VX7EventPublisher.h"

#include <iostream>
#include <memory>
#include <utility>
#include <vector>

#include "catalogue/cas/CAS.h"
#include "catalogue/chp/CHP.h"
#include "catalogue/cluster/Cluster.h"
#include "catalogue/generated/values.h"
#include "catalogue/lcon/LCON.h"
#include "catalogue/tsc/TSC.h"
#include "framework/MsgQueue.h"
#include "framework/tolk.h"
#include "model/Board.h"
#include "model/Guarded.h"

namespace vx7diag {

std::map<tolk::Addressable*, VX7EventPublisher*> g_publishers;

namespace {

// g_publishers is written on the console thread and read on every reader thread.
isa::CriticalSection& PublishersLock() {
    static isa::CriticalSection section;
    return section;
}

void VX7EventPublisher_UnregisteredMsgHandler(tolk::Addressable*, tolk::Msg* msg) {
    delete msg;
}
void VX7EventPublisher_UnregisteredEvtGroupHandler(tolk::Addressable*, tolk::Msg* msg) {
    delete msg;
}
void VX7EventPublisher_UnregisteredSourceHandler(tolk::MsgQueue&, tolk::Msg* msg) {
    delete msg;
}

void RegisterUnregisteredHandlers(tolk::Addressable& object) {
    object.asyncUnregisteredMsgType(VX7EventPublisher_UnregisteredMsgHandler, 0);
    object.asyncUnregisteredEvtGroup(VX7EventPublisher_UnregisteredEvtGroupHandler, 0);
    object.UnregisteredSource(VX7EventPublisher_UnregisteredSourceHandler);
}

// Registers the publication's callback on the component; false for a handler type nobody knows.
bool RegisterCallback(tolk::Addressable& object, int kind, VX7EventPublication* publication) {
    unsigned int group = publication->Group();
    if (kind == VX7EventPublisher::CAS_COMPONENT) {
        object.asyncRegisterEvtGroup(group, publication->Handler(), 100);
        return true;
    }
    if (kind == VX7EventPublisher::LCON_COMPONENT) {
        object.asyncRegisterEvtGroup(group, publication->Handler(), 0);
        return true;
    }
    int handlerType = publication->QueryHandlerType();
    if (handlerType == 2) {
        object.asyncRegisterEvtGroup(group, publication->MsgHandler(), 0);
        return true;
    }
    if (handlerType == 1) {
        object.asyncRegisterEvtGroup(group, publication->Handler(), 0);
        return true;
    }
    std::cout << "VX7Publisher::Subscribe - ERROR: unknown handler type = " << handlerType
              << std::endl;
    return false;
}

void CancelCallback(tolk::Addressable& object, VX7EventPublication* publication) {
    if (publication->QueryHandlerType() == 1) {
        object.asyncCancelEvtGroup(publication->Group(), publication->Handler(), 0);
    } else {
        object.asyncCancelEvtGroup(publication->Group(), publication->MsgHandler(), 0);
    }
}

}  // namespace

VX7EventPublisher::VX7EventPublisher(unsigned int b, unsigned int t, unsigned int c)
    : board(b), trunk(t), channel(c) {
    tolk::tolkInit();
}

VX7EventPublisher::~VX7EventPublisher() {
    std::vector<std::pair<Aspect*, isa::RefPtr<Observer>>> pairs;
    {
        isa::AutoCriticalSection guard(observersLock);
        for (auto& [aspect, set] : observers) {
            for (const isa::RefPtr<Observer>& observer : set) {
                pairs.emplace_back(aspect, observer);
            }
        }
    }
    for (auto& [aspect, observer] : pairs) {
        Detach(observer, *aspect);
    }
    // A cancellation that the board refused or never answered leaves its component behind with
    // the callback still registered; that callback would come back here after we are gone.
    ReleaseComponents();
    DeleteClusters();
}

void VX7EventPublisher::GetChannel(unsigned int& b, unsigned int& t, unsigned int& c) {
    b = board;
    t = trunk;
    c = channel;
}

VX7EventPublisher* VX7EventPublisher::GetMyPublisher(tolk::Addressable* component) {
    isa::AutoCriticalSection guard(PublishersLock());
    auto entry = g_publishers.find(component);
    return entry == g_publishers.end() ? nullptr : entry->second;
}

void VX7EventPublisher::SetPublisher(tolk::Addressable* component) {
    isa::AutoCriticalSection guard(PublishersLock());
    g_publishers[component] = this;
}

void VX7EventPublisher::ForgetPublisher(tolk::Addressable* component) {
    isa::AutoCriticalSection guard(PublishersLock());
    auto entry = g_publishers.find(component);
    if (entry != g_publishers.end() && entry->second == this) {
        g_publishers.erase(entry);
    }
}

bool VX7EventPublisher::Attach(isa::RefPtr<Observer> observer, Aspect* aspect) {
    isa::AutoCriticalSection guard(lock);
    {
        isa::AutoCriticalSection map(observersLock);
        if (!Subject::Attach(observer, aspect)) {
            return false;
        }
    }
    bool started = false;
    RunGuarded(std::cout, "VX7EventPublisher::Attach - ", [&] { started = Start(aspect); });
    if (started) {
        return true;
    }
    bool nobodyLeft;
    {
        isa::AutoCriticalSection map(observersLock);
        Subject::Detach(observer, *aspect);
        nobodyLeft = observers.empty();
    }
    if (nobodyLeft) {
        DeleteClusters();
    }
    return false;
}

int VX7EventPublisher::Detach(const isa::RefPtr<Observer>& observer, const Aspect& aspect) {
    isa::AutoCriticalSection guard(lock);
    int left;
    {
        isa::AutoCriticalSection map(observersLock);
        left = Subject::Detach(observer, aspect);
    }
    if (left == -1) {
        return 0;
    }
    if (left == 0) {
        RunGuarded(std::cout, "VX7EventPublisher::Detach - ", [&] { Stop(aspect); });
    }
    return left;
}

void VX7EventPublisher::Notify(Aspect& aspect) {
    isa::AutoCriticalSection map(observersLock);
    Subject::Notify(aspect);
}

int VX7EventPublisher::ObserverCount(const Aspect& aspect) {
    isa::AutoCriticalSection map(observersLock);
    auto entry = observers.find(const_cast<Aspect*>(&aspect));
    return entry == observers.end() ? 0 : static_cast<int>(entry->second.size());
}

unsigned int VX7EventPublisher::GetCount(int component) const {
    switch (component) {
        case CAS_COMPONENT:
            return casCount;
        case CHP_COMPONENT:
            return chpCount;
        case LCON_COMPONENT:
            return lconCount;
        case TSC_COMPONENT:
            return tscCount;
        default:
            return 0;
    }
}

bool VX7EventPublisher::Start(Aspect* aspect) {
    auto* publication = dynamic_cast<VX7EventPublication*>(aspect);
    if (publication == nullptr) {
        return false;
    }
    if (tscCluster == nullptr && lconCluster == nullptr) {
        tolk::Board temporary(board);
        RegisterUnregisteredHandlers(temporary);
        std::unique_ptr<tolk::Cluster> channelCluster(
            new tolk::Cluster(Captured([&] { return temporary.findClustByTSC(trunk, channel); })));
        RegisterUnregisteredHandlers(*channelCluster);
        std::unique_ptr<tolk::Cluster> lineCluster(
            new tolk::Cluster(Captured([&] { return temporary.findClustByLCON(trunk); })));
        RegisterUnregisteredHandlers(*lineCluster);
        tscCluster = channelCluster.release();
        lconCluster = lineCluster.release();
    }
    if (ObserverCount(*aspect) == 1) {
        return Subscribe(publication);
    }
    return true;
}

// Tells the component to report the publication's events to this process's address.
template <class Component>
bool RequestEvents(Component* object, int kind, VX7EventPublication* publication) {
    return RunGuarded(std::cout, "VX7EventPublisher::Subscribe - ", [&] {
        unsigned int group = publication->Group();
        if (kind == VX7EventPublisher::TSC_COMPONENT) {
            tolk::staticList<unsigned int> types = publication->EventTypeList();
            if (types.length() != 0) {
                object->DetectxEvts(types, group, nullptr);
                return;
            }
        }
        object->DetectEvt(group, 0, nullptr);
    });
}

template <class Component>
bool SubscribeOn(VX7EventPublisher* publisher, Component*& object, unsigned int& count,
                 tolk::Cluster* cluster, unsigned char type, int kind,
                 VX7EventPublication* publication,
                 void (VX7EventPublisher::*remember)(tolk::Addressable*),
                 void (VX7EventPublisher::*forget)(tolk::Addressable*)) {
    bool made = false;
    auto dropIfUnused = [&] {
        if (made && count == 0) {
            (publisher->*forget)(object);
            delete object;
            object = nullptr;
        }
    };
    try {
        if (object == nullptr) {
            tolk::TmpInstance instance = Captured([&] { return cluster->find(type); });
            std::unique_ptr<Component> fresh(new Component(instance));
            RegisterUnregisteredHandlers(*fresh);
            object = fresh.release();
            made = true;
            // Before the callback is registered, so that its first event finds us.
            (publisher->*remember)(object);
        }
        if (!RegisterCallback(*object, kind, publication)) {
            dropIfUnused();
            return false;
        }
    } catch (...) {
        dropIfUnused();
        throw;
    }

    if (!RequestEvents(object, kind, publication)) {
        RunGuarded(std::cout, "VX7EventPublisher::Subscribe - ", [&] {
            object->asyncCancelEvtGroup(publication->Group(), publication->Handler(), 0);
        });
        dropIfUnused();
        return false;
    }
    ++count;
    return true;
}

bool VX7EventPublisher::Subscribe(VX7EventPublication* publication) {
    int kind = publication->Component();
    switch (kind) {
        case CAS_COMPONENT:
            return SubscribeOn(this, cas, casCount, tscCluster, tolk::wire::CAS::Component::TYPE,
                               kind, publication, &VX7EventPublisher::SetPublisher,
                               &VX7EventPublisher::ForgetPublisher);
        case CHP_COMPONENT:
            return SubscribeOn(this, chp, chpCount, tscCluster, tolk::wire::CHP::Component::TYPE,
                               kind, publication, &VX7EventPublisher::SetPublisher,
                               &VX7EventPublisher::ForgetPublisher);
        case LCON_COMPONENT:
            return SubscribeOn(
                this, lcon, lconCount, lconCluster, tolk::wire::LCON::Component::TYPE, kind,
                publication, &VX7EventPublisher::SetPublisher, &VX7EventPublisher::ForgetPublisher);
        case TSC_COMPONENT:
            return SubscribeOn(this, tsc, tscCount, tscCluster, tolk::wire::TSC::Component::TYPE,
                               kind, publication, &VX7EventPublisher::SetPublisher,
                               &VX7EventPublisher::ForgetPublisher);
        default:
            return true;
    }
}

bool VX7EventPublisher::Resubscribe() {
    isa::AutoCriticalSection guard(lock);
    std::vector<VX7EventPublication*> watched;
    {
        isa::AutoCriticalSection map(observersLock);
        for (auto& [aspect, set] : observers) {
            auto* publication = dynamic_cast<VX7EventPublication*>(aspect);
            if (!set.empty() && publication != nullptr) {
                watched.push_back(publication);
            }
        }
    }
    bool all = true;
    for (VX7EventPublication* publication : watched) {
        int kind = publication->Component();
        bool ok = true;
        switch (kind) {
            case CAS_COMPONENT:
                ok = cas == nullptr || RequestEvents(cas, kind, publication);
                break;
            case CHP_COMPONENT:
                ok = chp == nullptr || RequestEvents(chp, kind, publication);
                break;
            case LCON_COMPONENT:
                ok = lcon == nullptr || RequestEvents(lcon, kind, publication);
                break;
            case TSC_COMPONENT:
                ok = tsc == nullptr || RequestEvents(tsc, kind, publication);
                break;
            default:
                break;
        }
        all = all && ok;
    }
    std::cout << "VX7EventPublisher::Resubscribe - board=" << board << " trunk=" << trunk
              << " channel=" << channel
              << (all ? ": subscribed again" : ": not all subscribed again") << std::endl;
    return all;
}

void VX7EventPublisher::Stop(const Aspect& aspect) {
    auto* publication = dynamic_cast<VX7EventPublication*>(const_cast<Aspect*>(&aspect));
    bool nobodyLeft;
    {
        isa::AutoCriticalSection map(observersLock);
        nobodyLeft = observers.empty();
    }
    if (nobodyLeft) {
        DeleteClusters();
    }
    if (publication != nullptr) {
        Unsubscribe(publication);
    }
}

template <class Component>
void UnsubscribeFrom(VX7EventPublisher* publisher, Component*& object, unsigned int& count,
                     const char* text, int kind, VX7EventPublication* publication,
                     void (VX7EventPublisher::*forget)(tolk::Addressable*)) {
    if (object == nullptr) {
        return;
    }
    try {
        unsigned int group = publication->Group();
        tolk::staticList<unsigned int> types = publication->EventTypeList();
        if (kind == VX7EventPublisher::CHP_COMPONENT ||
            (kind == VX7EventPublisher::TSC_COMPONENT && types.length() != 0)) {
            object->CancelxEvts(types, nullptr);
        } else {
            object->CancelEvt(group, nullptr);
        }
        CancelCallback(*object, publication);
        if (count > 0) {
            --count;
        }
        if (count == 0) {
            (publisher->*forget)(object);
            delete object;
            object = nullptr;
        }
    } catch (const tolk::Addressable::Timeout& e) {
        std::cout << "UnSubscribe: " << text << " Timeout Exception.  Ignoring" << std::endl
                  << e << std::flush;
    } catch (const tolk::Addressable::UnexpectedMsg& e) {
        std::cout << "UnSubscribe: " << text << "UnexpectedMsg Exception.  Ignoring" << std::endl
                  << e << std::endl;
    }
}

void VX7EventPublisher::Unsubscribe(VX7EventPublication* publication) {
    int kind = publication->Component();
    switch (kind) {
        case CAS_COMPONENT:
            UnsubscribeFrom(this, cas, casCount, "CAS Component", kind, publication,
                            &VX7EventPublisher::ForgetPublisher);
            break;
        case CHP_COMPONENT:
            UnsubscribeFrom(this, chp, chpCount, "CHP Component", kind, publication,
                            &VX7EventPublisher::ForgetPublisher);
            break;
        case LCON_COMPONENT:
            UnsubscribeFrom(this, lcon, lconCount, "LCON Component", kind, publication,
                            &VX7EventPublisher::ForgetPublisher);
            break;
        case TSC_COMPONENT:
            UnsubscribeFrom(this, tsc, tscCount, "TSC Component", kind, publication,
                            &VX7EventPublisher::ForgetPublisher);
            break;
        default:
            std::cout << "Unsubscribe -  unknown component" << std::endl;
            break;
    }
}

void VX7EventPublisher::DeleteClusters() {
    delete tscCluster;
    tscCluster = nullptr;
    delete lconCluster;
    lconCluster = nullptr;
}

template <class Component>
void Release(VX7EventPublisher* publisher, Component*& object, unsigned int& count,
             void (VX7EventPublisher::*forget)(tolk::Addressable*)) {
    if (object == nullptr) {
        return;
    }
    (publisher->*forget)(object);
    // The board never confirmed the cancellation, so events may still come. Without their
    // registrations they go to the unregistered handler; cancelling also waits for a delivery
    // that is under way on the reader thread, which may be inside our Notify.
    for (unsigned int group :
         {tolk::TSC::EvtCallInfo_t::EvtGroup_, tolk::TSC::EvtCallState_t::EvtGroup_,
          tolk::TSC::EvtChanState_t::EvtGroup_, tolk::LCON::Evt_0x1600_t::EvtGroup_,
          tolk::LCON::Evt_0x1611_t::EvtGroup_}) {
        try {
            object->asyncCancelEvtGroup(group);
        } catch (const tolk::Exception&) {
            // Not registered on this component.
        }
    }
    delete object;
    object = nullptr;
    count = 0;
}

void VX7EventPublisher::ReleaseComponents() {
    Release(this, cas, casCount, &VX7EventPublisher::ForgetPublisher);
    Release(this, chp, chpCount, &VX7EventPublisher::ForgetPublisher);
    Release(this, lcon, lconCount, &VX7EventPublisher::ForgetPublisher);
    Release(this, tsc, tscCount, &VX7EventPublisher::ForgetPublisher);
}

}  // namespace vx7diag
