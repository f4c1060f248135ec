#include "catalogue/cas/CAS.h"

namespace tolk {

namespace {

cat::ValueWord wordOf(staticList<unsigned char>* list) {
    return reinterpret_cast<cat::ValueWord>(list);
}

}  // namespace

CAS::CAS(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q) : Instance(target, q) {
    registerNullHandlers();
}

CAS::CAS(const Instance& other) : Instance(other) {
    registerNullHandlers();
}

CAS::CAS(const CAS& other) : Instance(other), CAS_Bodies() {
    registerNullHandlers();
}

void CAS::registerNullHandlers() {
    asyncRegisterMsgType(MsgDialCmplt_t::MsgType, static_cast<EvtCallback::MsgFn>(nullptr), 0);
}

CAS::~CAS() {
    endDispatch();
}

MsgBody* CAS::MsgBodyLookup(unsigned int type) {
    if (MsgBody* body = CAS_Bodies::msgLookup(type)) {
        return body;
    }
    return Instance::superMsgBodyLookup(type);
}

MsgBody* CAS::EvtBodyLookup(unsigned int group) {
    if (MsgBody* body = CAS_Bodies::evtLookup(group)) {
        return body;
    }
    return Instance::superEvtBodyLookup(group);
}

void CAS::DisableSignal(MsgDisableSignal_t* body, MsgDisableSignalCmplt_t* ret) {
    request(MsgDisableSignal_t::MsgType, body, MsgDisableSignalCmplt_t::MsgType, ret);
}

void CAS::DisableSignal(unsigned int SignalId, MsgDisableSignalCmplt_t* ret) {
    MsgDisableSignal_t body(SignalId);
    request(MsgDisableSignal_t::MsgType, &body, MsgDisableSignalCmplt_t::MsgType, ret);
}

void CAS::EnableSignal(MsgEnableSignal_t* body, MsgEnableSignalCmplt_t* ret) {
    request(MsgEnableSignal_t::MsgType, body, MsgEnableSignalCmplt_t::MsgType, ret);
}

void CAS::EnableSignal(unsigned int SignalId, MsgEnableSignalCmplt_t* ret) {
    MsgEnableSignal_t body(SignalId);
    request(MsgEnableSignal_t::MsgType, &body, MsgEnableSignalCmplt_t::MsgType, ret);
}

void CAS::GenerateSignal(MsgGenerateSignal_t* body, MsgGenerateSignalCmplt_t* ret) {
    request(MsgGenerateSignal_t::MsgType, body, MsgGenerateSignalCmplt_t::MsgType, ret);
}

void CAS::GenerateSignal(unsigned int SignalId, MsgGenerateSignalCmplt_t* ret) {
    GenerateSignal(SignalId, static_cast<unsigned short>(0), 0, ret);
}

void CAS::GenerateSignal(unsigned int SignalId, unsigned short Count,
                         MsgGenerateSignalCmplt_t* ret) {
    GenerateSignal(SignalId, Count, 0, ret);
}

// The default list lives on the stack for the send, instead of being left on the heap.
void CAS::GenerateSignal(unsigned int SignalId, unsigned short Count, unsigned char Format,
                         MsgGenerateSignalCmplt_t* ret) {
    staticList<unsigned char> empty;
    GenerateSignal(SignalId, Count, Format, wordOf(&empty), ret);
}

void CAS::GenerateSignal(unsigned int SignalId, unsigned short Count, unsigned char Format,
                         cat::ValueWord SignalList, MsgGenerateSignalCmplt_t* ret) {
    MsgGenerateSignal_t body(SignalId, Count, Format, SignalList);
    request(MsgGenerateSignal_t::MsgType, &body, MsgGenerateSignalCmplt_t::MsgType, ret);
}

void CAS::StartGenerateSignal(MsgGenerateSignal_t* body) {
    request(MsgGenerateSignal_t::MsgType, body);
}

void CAS::StartGenerateSignal(unsigned int SignalId, unsigned short Count, unsigned char Format) {
    staticList<unsigned char> empty;
    StartGenerateSignal(SignalId, Count, Format, wordOf(&empty));
}

void CAS::StartGenerateSignal(unsigned int SignalId, unsigned short Count, unsigned char Format,
                              cat::ValueWord SignalList) {
    MsgGenerateSignal_t body(SignalId, Count, Format, SignalList);
    request(MsgGenerateSignal_t::MsgType, &body);
}

void CAS::Dial(MsgDial_t* body, MsgDialCmplt_t* ret) {
    request(MsgDial_t::MsgType, body, MsgDialCmplt_t::MsgType, ret);
}

void CAS::Dial(unsigned int SignalId, const staticList<char>& DigitString, MsgDialCmplt_t* ret) {
    staticList<char> digits(DigitString);
    MsgDial_t body(SignalId, digits);
    request(MsgDial_t::MsgType, &body, MsgDialCmplt_t::MsgType, ret);
}

void CAS::StartDial(MsgDial_t* body) {
    request(MsgDial_t::MsgType, body);
}

void CAS::StartDial(unsigned int SignalId, const staticList<char>& DigitString) {
    staticList<char> digits(DigitString);
    MsgDial_t body(SignalId, digits);
    request(MsgDial_t::MsgType, &body);
}

void CAS::StopSignal(MsgStopSignal_t* body) {
    request(MsgStopSignal_t::MsgType, body);
}

void CAS::StopSignal() {
    MsgStopSignal_t body;
    request(MsgStopSignal_t::MsgType, &body);
}

void CAS::MatchCondition(MsgMatchCondition_t* body, MsgMatchConditionCmplt_t* ret) {
    request(MsgMatchCondition_t::MsgType, body, MsgMatchConditionCmplt_t::MsgType, ret);
}

void CAS::MatchCondition(unsigned int SignalId, unsigned char Condition,
                         MsgMatchConditionCmplt_t* ret) {
    MsgMatchCondition_t body(SignalId, Condition);
    request(MsgMatchCondition_t::MsgType, &body, MsgMatchConditionCmplt_t::MsgType, ret);
}

}  // namespace tolk
