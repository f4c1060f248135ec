// The state of the emulated boards, over plain data: channels with their calls, lines with their
// alarms, cluster ports, and who subscribed to which events. Operations change the state and
// report what a board would report as abstract events; Emulation turns them into messages.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "catalogue/generated/lcon_bodies.h"
#include "catalogue/generated/tsc_bodies.h"
#include "catalogue/generated/values.h"
#include "platform/farm/Addresses.h"
#include "platform/farm/Farm.h"

namespace sim {

using Address = farm::Address;

std::uint64_t addressKey(const Address& a);

// Values the console and the trace show by name; a board sends nothing else.
namespace call {
namespace v = tolk::wire::TSC::CallState;
enum : std::uint32_t {
    Null = v::NULL_STATE,
    Accepted = v::ACCEPTED,
    Connected = v::CONNECTED,
    Dialing = v::DIALING,
    Disconnected = v::DISCONNECTED,
    Idle = v::IDLE,
    Offered = v::OFFERED,
    Hold = v::HOLD,
    HoldPendXfer = v::HOLD_PEND_XFER,
    Proceeding = v::PROCEEDING,
    Alerting = v::ALERTING,
};
}  // namespace call
namespace chan {
namespace v = tolk::wire::TSC::ChanState;
enum : std::uint32_t {
    Active = v::ACTIVE,
    OutOfService = v::OUT_OF_SERVICE,
    MediaDetached = v::MEDIA_DETACHED
};
}  // namespace chan
namespace reason {
namespace v = tolk::wire::TSC::Reason;
enum : std::uint32_t {
    None = v::NONE,
    Canceled = v::CANCELED,
    DestBusy = v::DEST_BUSY,
    DestOutOfOrder = v::DEST_OUT_OF_ORDER,
    IncomingCall = v::INCOMING_CALL,
    Normal = v::NORMAL,
    NetworkAlarm = v::NETWORK_ALARM,
    Transfer = v::TRANSFER,
    OutOfOrder = v::OUT_OF_ORDER,
};
}  // namespace reason

// Line states and the line control's events.
constexpr std::uint32_t kInService = tolk::wire::LCON::LineState::IN_SERVICE;
constexpr std::uint32_t kOutOfService = tolk::wire::LCON::LineState::OUT_OF_SERVICE;
constexpr std::uint32_t kLineReasonStartup = tolk::wire::LCON::LineReason::STARTUP;
constexpr std::uint32_t kAlarmLoopback = tolk::wire::LCON::Alarm::LOOPBACK;
constexpr std::uint32_t kAlarmBpvSaturation = tolk::wire::LCON::Alarm::BPV_SATURATION;
constexpr std::uint32_t kAlarmFerrSaturation = tolk::wire::LCON::Alarm::FERR_SATURATION;

// Event types as subscriptions name them. A subscription to a group number takes every event of
// the group; one to a single type takes that type.
constexpr std::uint32_t kGroupCallInfo = tolk::TSC_Bodies::EvtCallInfo_t::EvtGroup_;
constexpr std::uint32_t kEvtCallInfoCallerId = tolk::wire::TSC::EvtType::CALL_INFO_CALLER_ID;
// A call state event's type is its group plus the call state.
constexpr std::uint32_t kGroupCallState = tolk::TSC_Bodies::EvtCallState_t::EvtGroup_;
constexpr std::uint32_t kGroupChanState = tolk::TSC_Bodies::EvtChanState_t::EvtGroup_;
constexpr std::uint32_t kChanStateTypeBase = tolk::wire::TSC::EvtType::CHAN_STATE_BASE;  // + state
constexpr std::uint32_t kGroupAlarms = tolk::LCON_Bodies::Evt_0x1600_t::EvtGroup_;
constexpr std::uint32_t kGroupLineState = tolk::LCON_Bodies::Evt_0x1611_t::EvtGroup_;
constexpr std::uint32_t kInfoIdCallerId = tolk::wire::TSC::InfoId::CALLER_ID;

// Values of the channel state command and of GetParm.
constexpr std::uint32_t kChanStateInService = tolk::wire::TSC::SetChanState::IN_SERVICE;
constexpr std::uint32_t kChanStateOutOfService = tolk::wire::TSC::SetChanState::OUT_OF_SERVICE;
constexpr std::uint32_t kParmTrunkType = tolk::wire::LCON::Parm::TRUNK_TYPE;
constexpr std::uint32_t kParmSignaling = tolk::wire::LCON::Parm::SIGNALING_TYPE;
constexpr std::uint32_t kParmRouting = tolk::wire::CHP::Parm::ROUTING_MODE;

struct Event {
    enum class Kind { CallState, ChanState, CallInfo, Alarm, LineState };
    Kind kind = Kind::CallState;
    Address source;           // the reporting component
    std::uint32_t type = 0;   // event type
    std::uint32_t group = 0;  // the group the type belongs to
    std::uint32_t a =
        0;  // CallState/CallInfo: call id; ChanState: state; Alarm: alarm; LineState: state
    std::uint32_t b = 0;  // CallState: state; CallInfo: info id; Alarm: state; LineState: reason
    std::uint32_t c = 0;  // CallState: reason
    std::string text;     // CallInfo
};

struct Channel;

struct Call {
    std::uint32_t id = 0;
    std::uint32_t state = call::Null;
    std::uint32_t reason = reason::None;
    Channel* peer = nullptr;      // the farm channel at the other end, if any
    std::string remote;           // the other party's number
    std::uint32_t consultId = 0;  // the consultation call of a transfer under way, if any
};

// Slots a cluster transmits on its talk port, and what it listens to on other ports.
struct Ports {
    std::uint16_t txSlot = 0;
    struct Listen {
        std::vector<std::uint16_t> slots;
        std::uint8_t encoding = 0;
        std::uint8_t idlePattern = 0;
        bool active = false;
    };
    std::map<std::uint32_t, Listen> listen;
};

struct Line;

struct Channel {
    farm::ChannelRef ref;
    Line* line = nullptr;
    std::string number;
    std::uint32_t chanState = chan::Active;
    bool adminOut = false;
    bool flexible = false;
    bool mediaAttached = false;
    std::vector<std::pair<std::uint32_t, Address>> media;
    std::optional<Call> call;
    Ports ports;
    Address tsc;
};

struct Line {
    unsigned board = 0;
    int trunk = 0;
    int type = 0;
    int signaling = 0;
    std::uint32_t state = kInService;
    std::uint32_t reason = kLineReasonStartup;
    std::uint8_t diagMode = 0;
    std::map<std::uint32_t, std::uint8_t> alarms;  // received alarms, 0x1601..0x160A
    std::set<std::uint32_t> transmitting;          // 0x160B..0x160E
    std::uint32_t bpvCount = 0;
    std::uint32_t ferrCount = 0;
    std::vector<Channel*> channels;
    Address lcon;
};

struct Subscription {
    std::uint32_t evtType = 0;
    std::uint32_t group = 0;
    Address retAddr;
    std::uint32_t trans = 0;
    Address owner;  // who asked: cancellations must come from there
};

// Call and line control of every board of a farm. Every operation returns 0 or an ErrorCode and
// appends the events it causes.
class Model {
  public:
    explicit Model(std::shared_ptr<const farm::Farm> farm);

    const farm::Farm& farm() const { return *farm_; }
    Channel* channel(unsigned board, int trunk, int channel);
    Line* line(unsigned board, int trunk);
    // The ports of a channel or ROC cluster, by its address; null for any other address.
    Ports* clusterPorts(const Address& cluster);

    std::uint32_t makeCall(Channel& ch, const std::string& dest, const std::string& orig,
                           std::uint32_t& callId, std::vector<Event>& ev);
    std::uint32_t answerCall(Channel& ch, std::uint32_t callId, std::vector<Event>& ev);
    std::uint32_t acceptCall(Channel& ch, std::uint32_t callId, std::vector<Event>& ev);
    std::uint32_t dropCall(Channel& ch, std::uint32_t callId, std::uint32_t why,
                           std::vector<Event>& ev);
    std::uint32_t releaseCall(Channel& ch, std::uint32_t callId, std::uint32_t why,
                              std::vector<Event>& ev);
    std::uint32_t rejectCall(Channel& ch, std::uint32_t callId, std::uint32_t why,
                             std::vector<Event>& ev);
    std::uint32_t holdCall(Channel& ch, std::uint32_t callId, std::vector<Event>& ev);
    std::uint32_t retrieveCall(Channel& ch, std::uint32_t callId, std::vector<Event>& ev);
    std::uint32_t blindTransfer(Channel& ch, std::uint32_t callId, std::vector<Event>& ev);
    // A supervised transfer: the call waits in HoldPendXfer while a consultation call (its own
    // id, its own call state events) reaches the target; completing hands the far end over to
    // the target, cancelling ends the consultation and takes the call back. Call id 0 means the
    // channel's present call (and its present consultation).
    std::uint32_t initTransfer(Channel& ch, std::uint32_t callId, std::uint32_t& consultId,
                               std::vector<Event>& ev);
    std::uint32_t completeTransfer(Channel& ch, std::uint32_t callId, std::uint32_t consultId,
                                   std::vector<Event>& ev);
    std::uint32_t cancelTransfer(Channel& ch, std::uint32_t callId, std::vector<Event>& ev);
    std::uint32_t dial(Channel& ch, std::uint32_t callId);
    // Call id 0 asks for the channel's present call; a channel without one answers Null.
    std::uint32_t callState(Channel& ch, std::uint32_t callId, std::uint32_t& id,
                            std::uint32_t& state, std::uint32_t& why);
    std::uint32_t setChanState(Channel& ch, std::uint32_t state, std::vector<Event>& ev);
    std::uint32_t reset(Channel& ch, std::vector<Event>& ev);
    std::uint32_t attachMedia(Channel& ch, std::vector<std::pair<std::uint32_t, Address>> media,
                              std::vector<Event>& ev);
    std::uint32_t detachMedia(Channel& ch, std::vector<Event>& ev);

    std::uint32_t setLineState(Line& line, std::uint32_t state, std::uint32_t why,
                               std::vector<Event>& ev);
    std::uint32_t setDiagMode(Line& line, std::uint32_t mode, std::vector<Event>& ev);
    std::uint32_t sendAlarm(Line& line, std::uint32_t alarm, std::vector<Event>& ev);
    std::uint32_t stopAlarm(Line& line, std::uint32_t alarm, std::vector<Event>& ev);
    std::uint8_t alarmState(const Line& line, std::uint32_t alarm) const;
    // Every alarm a line reports when asked for all of them, in number order.
    static const std::vector<std::uint32_t>& reportedAlarms();

    // What the network does, for the control channel.
    std::uint32_t incomingCall(Channel& ch, const std::string& from, std::uint32_t& callId,
                               std::vector<Event>& ev);
    std::uint32_t farEndHangup(Channel& ch, std::vector<Event>& ev);
    std::uint32_t setAlarm(Line& line, std::uint32_t alarm, bool on, std::vector<Event>& ev);
    // One saturation event; the count it adds to is the line's.
    void saturation(Line& line, std::uint32_t alarm, std::vector<Event>& ev);

    // Subscriptions by the address of the component that reports.
    void subscribe(const Address& component, Subscription s);
    // Removes what `owner` subscribed with `trans` for `evtType` (every type if evtType is null).
    void cancel(const Address& component, const Address& owner, std::uint32_t trans,
                const std::optional<std::uint32_t>& evtType);
    // Removes every subscription that names this address as owner or return address.
    void forget(const Address& host);
    // The deliveries one event makes: one per subscriber and group.
    void subscribersOf(const Event& e, std::vector<const Subscription*>& out) const;
    std::size_t subscriptionCount() const;

    std::uint32_t nextTimestamp() { return ++clock_; }

  private:
    Call* findCall(Channel& ch, std::uint32_t callId);
    void callEvent(Channel& ch, std::vector<Event>& ev);
    void consultEvent(Channel& ch, std::uint32_t state, std::uint32_t why, std::vector<Event>& ev);
    void chanEvent(Channel& ch, std::vector<Event>& ev);
    void setCall(Channel& ch, std::uint32_t state, std::uint32_t why, std::vector<Event>& ev);
    // Ends the call on `ch` (to `localState`) and tells a farm peer that the far end has gone.
    void endCall(Channel& ch, std::uint32_t localState, std::uint32_t why, std::uint32_t peerWhy,
                 std::vector<Event>& ev);
    std::uint32_t serviceState(const Channel& ch) const;
    void refreshChanState(Channel& ch, std::vector<Event>& ev);
    Event lineEvent(const Line& line, Event::Kind kind, std::uint32_t type, std::uint32_t a,
                    std::uint32_t b);

    std::shared_ptr<const farm::Farm> farm_;
    std::map<std::uint64_t, std::unique_ptr<Channel>> channels_;  // by TSC address
    std::map<std::uint64_t, std::unique_ptr<Line>> lines_;        // by LCON address
    std::map<std::uint64_t, Ports> rocPorts_;                     // by ROC cluster address
    std::map<std::uint64_t, std::vector<Subscription>> subs_;     // by reporting component
    std::uint32_t nextCallId_ = 0x100;
    std::uint32_t clock_ = 0;
};

}  // namespace sim
