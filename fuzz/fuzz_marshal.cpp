// Random bytes as a received message body, read by the framework's own bodies and by a few
// hand-made shapes with counted and trailing lists, then printed.

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <sstream>

#include "catalogue/generated/wire.h"
#include "framework/CompAttr_t.h"
#include "framework/CompDesc_t.h"
#include "framework/Marshal.h"
#include "framework/Msg.h"
#include "framework/MsgDefault_t.h"
#include "framework/MsgEvtDetected_t.h"

namespace {

using tolk::Msg;
using tolk::staticList;

class CountedWords : public tolk::MsgBody {
  public:
    unsigned int writeMsg(Msg* m, unsigned int off) override {
        count = words.length();
        off = tolk::putFirst(m, off, tolk::wire::pack(tolk::wire::U32), &count);
        return tolk::putList(m, off, tolk::wire::U32, words, false);
    }
    unsigned int readMsg(Msg* m, unsigned int off) override {
        off = tolk::getFirst(m, off, tolk::wire::pack(tolk::wire::U32), &count);
        // Counts the list may hold but no message carries only cost time here: fold them down
        // and keep the impossible ones, which must be refused.
        if (count <= staticList<unsigned int>::MaxBytes / 4) {
            count %= 2048;
        }
        return tolk::getList(m, off, tolk::wire::U32, words, count, false);
    }
    unsigned int GetByteSize() override { return 4 + 4 * words.length(); }
    void toStream(std::ostream* os) const override {
        *os << "{Count " << count << " " << words << "}";
    }
    unsigned int count = 0;
    staticList<unsigned int> words;
};

class AddrAndAttrs : public tolk::MsgBody {
  public:
    unsigned int writeMsg(Msg* m, unsigned int off) override {
        off = addr.writeMsg(m, off);
        off = tolk::putFixed(m, off, tolk::wire::CHAR, 128, name, false);
        n = static_cast<unsigned char>(shorts.length());
        off = tolk::putField(m, off, tolk::wire::pack(tolk::wire::U8), &n);
        off = tolk::putList(m, off, tolk::wire::U16, shorts, false);
        return tolk::putBodies(m, off, attrs);
    }
    unsigned int readMsg(Msg* m, unsigned int off) override {
        off = addr.readMsg(m, off);
        off = tolk::getFixed(m, off, tolk::wire::CHAR, 128, name, false);
        off = tolk::getField(m, off, tolk::wire::pack(tolk::wire::U8), &n);
        off = tolk::getList(m, off, tolk::wire::U16, shorts, n, false);
        return tolk::getTrailingBodies(m, off, attrs);
    }
    unsigned int GetByteSize() override {
        return 6 + 128 + 1 + 2 * shorts.length() + 8 * attrs.length();
    }
    void toStream(std::ostream* os) const override {
        *os << "{" << addr << " " << shorts << " " << attrs << "}";
    }
    tolk::CompDesc_t addr;
    staticList<char> name;
    unsigned char n = 0;
    staticList<unsigned short> shorts;
    staticList<tolk::CompAttr_t> attrs;
};

template <class Body>
void readAndPrint(Msg& m, unsigned int off) {
    Body b;
    try {
        m.read(&b, off);
    } catch (const tolk::Exception&) {
        return;  // an impossible count is refused, never allocated
    }
    std::ostringstream os;
    os << b;
    // What was read must write back into a message of the size it reports.
    if (b.GetByteSize() > (1u << 20)) {
        return;
    }
    Msg out(b.GetByteSize());
    out.write(&b, 0);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size > 65536) {
        return 0;
    }
    Msg m(static_cast<unsigned int>(size));
    if (size != 0) {
        std::memcpy(tkMsgBody(m.getMsgRef()), data, size);
    }
    unsigned int off = size != 0 ? data[0] % 8 : 0;
    readAndPrint<tolk::MsgDefault_t>(m, off);
    readAndPrint<tolk::CompDesc_t>(m, 0);
    readAndPrint<tolk::CompAttr_t>(m, off);
    readAndPrint<tolk::MsgEvtDetected_t>(m, 0);
    readAndPrint<CountedWords>(m, 0);
    readAndPrint<AddrAndAttrs>(m, 0);
    std::ostringstream os;
    os << m;
    return 0;
}
