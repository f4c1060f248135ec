#pragma once

#include "catalogue/generated/cas_bodies.h"
#include "catalogue/stdresource/Instance.h"

namespace tolk {

// Signalling of one channel: enable, disable, generate and match signals, dial digits.
class CAS : public Instance, public CAS_Bodies {
  public:
    // Both register a null handler for 0x1416, the completion of StartDial.
    CAS(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    explicit CAS(const Instance& other);
    CAS(const CAS& other);
    CAS& operator=(const CAS&) = delete;
    ~CAS() override;

    MsgBody* MsgBodyLookup(unsigned int type) override;
    MsgBody* EvtBodyLookup(unsigned int group) override;

    void DisableSignal(MsgDisableSignal_t* body, MsgDisableSignalCmplt_t* ret);
    void DisableSignal(unsigned int SignalId, MsgDisableSignalCmplt_t* ret);
    void EnableSignal(MsgEnableSignal_t* body, MsgEnableSignalCmplt_t* ret);
    void EnableSignal(unsigned int SignalId, MsgEnableSignalCmplt_t* ret);
    // SignalList holds the address of a staticList<unsigned char>, or of a staticList<char>
    // for Format 2 and 3; without it an empty byte list goes out. Count travels as given.
    void GenerateSignal(MsgGenerateSignal_t* body, MsgGenerateSignalCmplt_t* ret);
    void GenerateSignal(unsigned int SignalId, MsgGenerateSignalCmplt_t* ret);
    void GenerateSignal(unsigned int SignalId, unsigned short Count, MsgGenerateSignalCmplt_t* ret);
    void GenerateSignal(unsigned int SignalId, unsigned short Count, unsigned char Format,
                        MsgGenerateSignalCmplt_t* ret);
    void GenerateSignal(unsigned int SignalId, unsigned short Count, unsigned char Format,
                        cat::ValueWord SignalList, MsgGenerateSignalCmplt_t* ret);
    void StartGenerateSignal(MsgGenerateSignal_t* body);
    void StartGenerateSignal(unsigned int SignalId, unsigned short Count = 0,
                             unsigned char Format = 0);
    void StartGenerateSignal(unsigned int SignalId, unsigned short Count, unsigned char Format,
                             cat::ValueWord SignalList);
    void Dial(MsgDial_t* body, MsgDialCmplt_t* ret);
    void Dial(unsigned int SignalId, const staticList<char>& DigitString, MsgDialCmplt_t* ret);
    void StartDial(MsgDial_t* body);
    void StartDial(unsigned int SignalId, const staticList<char>& DigitString);
    void StopSignal(MsgStopSignal_t* body);
    void StopSignal();
    void MatchCondition(MsgMatchCondition_t* body, MsgMatchConditionCmplt_t* ret);
    void MatchCondition(unsigned int SignalId, unsigned char Condition,
                        MsgMatchConditionCmplt_t* ret);

  private:
    void registerNullHandlers();
};

}  // namespace tolk
