// What the emulation sends: answers and refusals, each held back by the delay the control set.
#include <ostream>

#include "catalogue/generated/stdresource_bodies.h"
#include "sim/EmulationInternal.h"
#include "transport/TKSMsgRef.h"

namespace sim {

using Std = tolk::StdResource_Bodies;

namespace {

// The block leaves the Msg, which then frees nothing.
TKMsg32Bit* takeBlock(tolk::Msg& m) {
    TKMsg32Bit* b = m.getMsgRef();
    *m.getTKMsgRef() = TKSMsgRef();
    return b;
}

}  // namespace

void Emulation::enqueue(TKMsg32Bit* block) {
    outbox_.push_back(Queued{now_ + std::chrono::milliseconds(delayMs_), block});
}

TKMsg32Bit* Emulation::popDue(Clock::time_point now) {
    if (outbox_.empty() || outbox_.front().due > now) {
        return nullptr;
    }
    TKMsg32Bit* b = outbox_.front().block;
    outbox_.pop_front();
    return b;
}

std::optional<Clock::time_point> Emulation::nextDue() const {
    if (outbox_.empty()) {
        return std::nullopt;
    }
    return outbox_.front().due;
}

void Emulation::post(std::uint32_t type, std::uint32_t trans, const Address& src,
                     const Address& tgt, tolk::MsgBody* body) {
    tolk::Msg m(body ? body->GetByteSize() : 0);
    m.setMsgType(type);
    m.setTrans(trans);
    tolk::CompDesc_t from = toCD(src);
    tolk::CompDesc_t to = toCD(tgt);
    m.setSrcAddr(from);
    m.setTgtAddr(to);
    if (body) {
        (void)body->writeMsg(&m, 0);
    }
    enqueue(takeBlock(m));
}

void Emulation::reply(Request& rq, std::uint32_t type, tolk::MsgBody* body) {
    post(type, rq.trans, rq.tgt, rq.src, body);
    rq.answered = true;
    stats_.answers++;
}

void Emulation::refuse(Request& rq, std::uint32_t code) {
    Std::MsgError_t err;
    err.ErrorMsg = rq.type;
    err.ErrorCode = code;
    // The parameter commands name the refused parameter; everything else carries no data.
    Std::MsgError_t::Data_ErrorMsg_0x12_t parm;
    if (rq.type == Std::MsgSetParm_t::MsgType || rq.type == Std::MsgGetParm_t::MsgType) {
        std::uint32_t num = 0;
        tolk::Msg& m = rq.msg;
        Std::MsgGetParm_t p;
        (void)p.readMsg(&m, 0);
        num = p.Num;
        parm.Num = num;
        parm.Val = 0;
        err.Data = reinterpret_cast<tolk::cat::ValueWord>(&parm);
    }
    reply(rq, Std::MsgError_t::MsgType, &err);
    err.Data = 0;
}

void Emulation::answer(Request& rq, std::uint32_t code, std::uint32_t okType) {
    if (code != 0) {
        refuse(rq, code);
    } else if (okType != 0) {
        reply(rq, okType, nullptr);
    }
}

void Emulation::unanswerable(Request& rq, const char* why) {
    stats_.unanswered++;
    log_ << "vx7sim: cannot answer message type 0x" << std::hex << rq.type << std::dec
         << " to {Node " << unsigned(rq.tgt.node) << " Board " << unsigned(rq.tgt.board)
         << " Processor " << unsigned(rq.tgt.processor) << " Component "
         << unsigned(rq.tgt.component) << " Instance " << rq.tgt.instance << "}: " << why
         << std::endl;
}

}  // namespace sim
