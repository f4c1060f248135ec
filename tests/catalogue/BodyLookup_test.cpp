// Which class knows which number: each looks up its own and passes the rest along its chain.

#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <typeinfo>

#include "OpSupport.h"
#include "catalogue/cas/CAS.h"
#include "catalogue/chp/CHP.h"
#include "catalogue/cluster/Cluster.h"
#include "catalogue/cluster/ClusterMgr.h"
#include "catalogue/cluster/Component.h"
#include "catalogue/lcon/LCON.h"
#include "catalogue/resourcemgr/ResourceMgr.h"
#include "catalogue/tsc/TSC.h"

namespace {

using tolk::Addressable;

enum class Space { Msg, Evt };

struct Row {
    const char* name;
    std::function<std::unique_ptr<Addressable>(isa::RefPtr<tolk::MsgQueue>&)> make;
    Space space;
    unsigned int number;
    const std::type_info* expected;  // null: the lookup must raise
};

template <class T>
std::function<std::unique_ptr<Addressable>(isa::RefPtr<tolk::MsgQueue>&)> maker() {
    return [](isa::RefPtr<tolk::MsgQueue>& q) -> std::unique_ptr<Addressable> {
        tolk::TmpInstance tmp(kTarget, q);
        if constexpr (std::is_base_of_v<tolk::Instance, T>) {
            return std::make_unique<T>(static_cast<const tolk::Instance&>(tmp));
        } else if constexpr (std::is_base_of_v<tolk::StdResource, T>) {
            return std::make_unique<T>(static_cast<const tolk::StdResource&>(tmp));
        } else {
            return std::make_unique<T>(&tmp);
        }
    };
}

const Row kRows[] = {
    {"StdResourceKnowsGetParm", maker<tolk::Component>(), Space::Msg, 0x12,
     &typeid(tolk::StdResource::MsgGetParm_t)},
    {"StdResourceHasNoBodyFor0x1F", maker<tolk::Component>(), Space::Msg, 0x1F, nullptr},
    {"ComponentKnowsNoEvent", maker<tolk::Component>(), Space::Evt, 0x1230, nullptr},
    {"TSCKnowsItsOwn", maker<tolk::TSC>(), Space::Msg, 0x1214, &typeid(tolk::TSC::MsgMakeCall_t)},
    {"TSCReplaces0x16", maker<tolk::TSC>(), Space::Msg, 0x16,
     &typeid(tolk::TSC::MsgDetectEvtSet_t)},
    {"TSCPassesStandardOnes", maker<tolk::TSC>(), Space::Msg, 0x00,
     &typeid(tolk::StdResource::MsgError_t)},
    {"TSCKnowsNothingAt0x2B", maker<tolk::TSC>(), Space::Msg, 0x2B, nullptr},
    {"TSCHasNoBodyFor0x1208", maker<tolk::TSC>(), Space::Msg, 0x1208, nullptr},
    {"TSCEventCallState", maker<tolk::TSC>(), Space::Evt, 0x1230,
     &typeid(tolk::TSC::EvtCallState_t)},
    {"TSCEventOfLCONUnknown", maker<tolk::TSC>(), Space::Evt, 0x1611, nullptr},
    {"LCONOwnVParm", maker<tolk::LCON>(), Space::Msg, 0x2F, &typeid(tolk::LCON::Std_MsgSetVParm_t)},
    {"LCONPassesStandardOnes", maker<tolk::LCON>(), Space::Msg, 0x12,
     &typeid(tolk::StdResource::MsgGetParm_t)},
    {"LCONLineStateCompletion", maker<tolk::LCON>(), Space::Msg, 0x1611,
     &typeid(tolk::LCON::MsgSetLineStateCmplt_t)},
    {"LCONLineStateEvent", maker<tolk::LCON>(), Space::Evt, 0x1611,
     &typeid(tolk::LCON::Evt_0x1611_t)},
    {"CASDialCompletion", maker<tolk::CAS>(), Space::Msg, 0x1416,
     &typeid(tolk::CAS::MsgDialCmplt_t)},
    {"CASDetectedSignalIsAMessage", maker<tolk::CAS>(), Space::Msg, 0x140E,
     &typeid(tolk::CAS::EvtDetectedSignal_t)},
    {"CASEvent0x1405", maker<tolk::CAS>(), Space::Evt, 0x1405,
     &typeid(tolk::CAS::EventId_AllSignals_t)},
    {"CASNoTSCNumbers", maker<tolk::CAS>(), Space::Msg, 0x1214, nullptr},
    {"CHPKnowsNoMessageNotEvenStandard", maker<tolk::CHP>(), Space::Msg, 0x12, nullptr},
    {"CHPKnowsNoError", maker<tolk::CHP>(), Space::Msg, 0x00, nullptr},
    {"CHPEvent5", maker<tolk::CHP>(), Space::Evt, 5, &typeid(tolk::CHP::EvtTrace_t)},
    {"CHPEvent6", maker<tolk::CHP>(), Space::Evt, 6, &typeid(tolk::CHP::_t)},
    {"CHPEvent7Unknown", maker<tolk::CHP>(), Space::Evt, 7, nullptr},
    {"ResourceMgrResult", maker<tolk::ResourceMgr>(), Space::Msg, 0x800007,
     &typeid(tolk::ResourceMgr::ComponentResult_t)},
    {"ResourceMgrNoStandard", maker<tolk::ResourceMgr>(), Space::Msg, 0x12, nullptr},
    {"ClusterMgrFind", maker<tolk::ClusterMgr>(), Space::Msg, 0x800053,
     &typeid(tolk::ClusterMgr::ClusterFind_t)},
    {"ClusterMgrNoClusterOps", maker<tolk::ClusterMgr>(), Space::Msg, 0x80001B, nullptr},
};

class BodyLookup : public ::testing::TestWithParam<Row> {};

TEST_P(BodyLookup, GivesTheBodyOrRaisesUndefined) {
    const Row& row = GetParam();
    auto queue = newQueue();
    std::unique_ptr<Addressable> object = row.make(queue);
    if (row.expected == nullptr) {
        if (row.space == Space::Msg) {
            EXPECT_THROW(delete object->MsgBodyLookup(row.number), Addressable::UndefinedMsgBody);
        } else {
            EXPECT_THROW(delete object->EvtBodyLookup(row.number), Addressable::UndefinedEvtBody);
        }
        return;
    }
    std::unique_ptr<tolk::MsgBody> body(row.space == Space::Msg
                                            ? object->MsgBodyLookup(row.number)
                                            : object->EvtBodyLookup(row.number));
    ASSERT_NE(body, nullptr);
    // typeid of a named reference: clang warns when the operand calls unique_ptr::operator*.
    const tolk::MsgBody& made = *body;
    EXPECT_EQ(typeid(made), *row.expected);
}

INSTANTIATE_TEST_SUITE_P(Chains, BodyLookup, ::testing::ValuesIn(kRows),
                         [](const ::testing::TestParamInfo<Row>& info) { return info.param.name; });

TEST(ClusterLookup, KnowsItsOwnAndTheServicesAnswers) {
    auto queue = newQueue();
    tolk::Cluster c(kTarget, queue);
    std::unique_ptr<tolk::MsgBody> own(c.MsgBodyLookup(0x800030));
    const tolk::MsgBody& ownBody = *own;
    EXPECT_EQ(typeid(ownBody), typeid(tolk::Cluster::ClusterSlotAssign_t));
    std::unique_ptr<tolk::MsgBody> result(c.MsgBodyLookup(0x80002C));
    const tolk::MsgBody& resultBody = *result;
    EXPECT_EQ(typeid(resultBody), typeid(tolk::ClusterMgr::ClusterResult_t));
    std::unique_ptr<tolk::MsgBody> comp(c.MsgBodyLookup(0x800007));
    const tolk::MsgBody& compBody = *comp;
    EXPECT_EQ(typeid(compBody), typeid(tolk::ClusterMgr::ComponentResult_t));
    EXPECT_THROW(c.EvtBodyLookup(0x1230), Addressable::UndefinedEvtBody);
}

// The service's own commands are not in a cluster's table, nor the resource manager's.
class ClusterForeignNumber : public ::testing::TestWithParam<unsigned int> {};

TEST_P(ClusterForeignNumber, Raises) {
    auto queue = newQueue();
    tolk::Cluster c(kTarget, queue);
    EXPECT_THROW(delete c.MsgBodyLookup(GetParam()), Addressable::UndefinedMsgBody);
}

INSTANTIATE_TEST_SUITE_P(ManagerCommands, ClusterForeignNumber,
                         ::testing::Values(0x80001Du, 0x80001Eu, 0x800020u, 0x800024u, 0x800051u,
                                           0x800052u, 0x800053u, 0x800059u, 0x80003Du, 0x12u));

}  // namespace
