// Every body of the catalogue, through the generated index: writes what it sizes, reads back
// what it wrote, and survives every truncation of a valid encoding.

#include "catalogue/CatBody.h"

#include <gtest/gtest.h>

#include <cctype>
#include <map>
#include <memory>
#include <set>
#include <string>

#include "Golden.h"
#include "catalogue/generated/index.h"

using namespace golden;
using tolk::MsgBody;
using tolk::cat::CatalogueEntry;
using tolk::cat::kCatalogue;
using tolk::cat::kCatalogueSize;

namespace {

// Records whose size counts four bytes for every element of a shaped value, whatever its
// width, and the bodies that hold them: their size may exceed what they write.
const std::set<std::string> kGenerousSize = {
    "MsgGetCallInfoCmplt_t", "MsgGetCallInfoCmplt_t::CallInfo_t",
    "EvtCallInfoSet_t",      "EvtCallInfoSet_t::CallInfo_t",
    "MsgAnswerCall_t",       "MsgAnswerCall_t::KVSet_t",
    "MsgDropCall_t",         "MsgDropCall_t::KVSet_t",
    "MsgMakeCall_t",         "MsgMakeCall_t::KVSet_t",
    "MsgRejectCall_t",       "MsgRejectCall_t::KVSet_t",
    "MsgDial_t::KVSet_t",    "MsgDial_t",
    "MsgProceedCall_t",      "MsgProceedCall_t::KVSet_t"};

// A body is filled by reading it from these bytes: varied values, counts that the bytes left
// cap, descriptors of every shape.
Bytes pattern(std::size_t n) {
    Bytes b(n);
    for (std::size_t i = 0; i < n; ++i) {
        b[i] = static_cast<std::uint8_t>((i * 37 + 11) ^ (i >> 3));
    }
    // Small counts up front keep the lists short and the records varied.
    for (std::size_t i = 0; i < n && i < 12; ++i) {
        b[i] = static_cast<std::uint8_t>(i & 3);
    }
    return b;
}

bool endsInBodyRun(const CatalogueEntry& e) {
    if (e.desc == nullptr || e.desc->count == 0) {
        return false;
    }
    const tolk::cat::Field& last = e.desc->fields[e.desc->count - 1];
    return last.kind == tolk::cat::Kind::TrailingList && !last.list->scalars;
}

std::string nameOf(const ::testing::TestParamInfo<unsigned int>& info) {
    const CatalogueEntry& e = kCatalogue[info.param];
    std::string s = std::string(e.cls) + "_" + e.name;
    for (char& c : s) {
        if (!std::isalnum(static_cast<unsigned char>(c))) {
            c = '_';
        }
    }
    return s;
}

class EveryBody : public ::testing::TestWithParam<unsigned int> {
  protected:
    const CatalogueEntry& entry() const { return kCatalogue[GetParam()]; }
    std::unique_ptr<MsgBody> make() const { return std::unique_ptr<MsgBody>(entry().make()); }
    std::unique_ptr<MsgBody> filled(std::size_t n = 200) const {
        auto b = make();
        auto m = msgOf(pattern(n));
        (void)b->readMsg(m.get(), 0);
        return b;
    }
};

TEST_P(EveryBody, WritesWhatItSizes) {
    auto b = filled();
    Encoded e = encode(*b);
    if (kGenerousSize.count(entry().name)) {
        EXPECT_LE(e.written, e.size);
    } else {
        EXPECT_EQ(e.written, e.size) << text(*b);
    }
}

TEST_P(EveryBody, ReadsBackWhatItWrote) {
    auto a = filled();
    Encoded first = encode(*a);
    auto b = make();
    auto m = msgOf(first.bytes);
    unsigned int end = b->readMsg(m.get(), 0);
    if (endsInBodyRun(entry())) {
        // A run of records without a count is sized to the bytes left: the copy holds the
        // records read, then default ones, so only the part before the run must match.
        std::string label =
            std::string(" ") + entry().desc->fields[entry().desc->count - 1].label + " ";
        std::string ta = text(*a), tb = text(*b);
        EXPECT_EQ(ta.substr(0, ta.find(label)), tb.substr(0, tb.find(label)));
        return;
    }
    EXPECT_EQ(text(*a), text(*b));
    if (!kGenerousSize.count(entry().name)) {
        EXPECT_EQ(end, first.written);
    }
    Encoded second = encode(*b);
    EXPECT_TRUE(SameBytes(second.bytes, first.bytes));
}

TEST_P(EveryBody, CopyHasTheSameValues) {
    auto a = filled();
    auto c = make();
    auto m = msgOf(encode(*a).bytes);
    (void)c->readMsg(m.get(), 0);
    Encoded x = encode(*c);
    auto d = make();
    auto m2 = msgOf(x.bytes);
    (void)d->readMsg(m2.get(), 0);
    EXPECT_EQ(text(*c).substr(0, 40), text(*d).substr(0, 40));
}

TEST_P(EveryBody, EveryPrefixReadsSafely) {
    Bytes full = encode(*filled()).bytes;
    for (std::size_t n = 0; n < full.size(); ++n) {
        auto b = make();
        auto m = msgOf(Bytes(full.begin(), full.begin() + static_cast<long>(n)));
        (void)b->readMsg(m.get(), 0);
        std::string t = text(*b);
        ASSERT_FALSE(t.empty());
        ASSERT_EQ(t.front(), '{');
    }
}

TEST_P(EveryBody, HostileCountsStayBounded) {
    // All ones: every count at its maximum, every descriptor at 256 elements.
    Bytes ones(64, 0xFF);
    auto b = make();
    auto m = msgOf(ones);
    (void)b->readMsg(m.get(), 0);
    EXPECT_LE(encode(*b).written, 64u * 64u + 1024u);
}

INSTANTIATE_TEST_SUITE_P(Catalogue, EveryBody, ::testing::Range(0u, kCatalogueSize), nameOf);

TEST(Catalogue, ListsEveryTableBody) {
    // Counts per class taken from the tables: messages, events and element records.
    std::map<std::string, int> perClass;
    for (unsigned int i = 0; i < kCatalogueSize; ++i) {
        if (kCatalogue[i].role != 'l') {
            ++perClass[kCatalogue[i].cls];
        }
    }
    EXPECT_EQ(perClass["StdResource"], 46);
    EXPECT_EQ(perClass["ResourceMgr"], 11);
    EXPECT_EQ(perClass["ClusterMgr"], 9);
    EXPECT_EQ(perClass["Cluster"], 16);
    EXPECT_EQ(perClass["TSC"], 61);
    EXPECT_EQ(perClass["LCON"], 31);
    EXPECT_EQ(perClass["CAS"], 14);
    EXPECT_EQ(perClass["CHP"], 2);
}

}  // namespace
