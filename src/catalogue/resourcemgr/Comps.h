#pragma once

// One component of a search answer: its address and its attributes up to a terminator, an
// attribute with key 0xFFFFFFFF whose value nobody reads.

#include <ostream>

#include "catalogue/CatBody.h"

namespace tolk::cat {

inline constexpr unsigned int kAttrTerminator = 0xFFFFFFFFu;

template <class Tag>
class CompsRecord : public MsgBody {
  public:
    static constexpr unsigned int kMinWireSize = 14;

    CompsRecord() = default;
    CompsRecord(const CompsRecord&) = default;
    CompsRecord& operator=(const CompsRecord&) = default;
    ~CompsRecord() override = default;

    unsigned int writeMsg(Msg* m, unsigned int off) override {
        off = compDesc.writeMsg(m, off);
        for (unsigned int i = 0; i < attrs.length(); ++i) {
            off = attrs[i]->writeMsg(m, off);
            if (attrs[i]->key == kAttrTerminator) {
                return off;
            }
        }
        CompAttr_t end(kAttrTerminator, 0);
        return end.writeMsg(m, off);
    }
    unsigned int readMsg(Msg* m, unsigned int off) override {
        off = compDesc.readMsg(m, off);
        attrs.realloc(bytesLeft(m, off) / 8);
        unsigned int n = 0;
        while (n < attrs.length() && bytesLeft(m, off) > 0) {
            unsigned int next = attrs[n]->readMsg(m, off);
            if (next <= off) {
                break;
            }
            off = next;
            if (attrs[n]->key == kAttrTerminator) {
                break;
            }
            ++n;
        }
        attrs.realloc(n);
        return off;
    }
    unsigned int GetByteSize() override {
        unsigned int n = 6;
        for (unsigned int i = 0; i < attrs.length(); ++i) {
            n += 8;
            if (attrs[i]->key == kAttrTerminator) {
                return n;
            }
        }
        return n + 8;
    }
    void toStream(std::ostream* os) const override {
        *os << "{compDesc ";
        compDesc.toStream(os);
        *os << " attrs ";
        attrs.toStream(os);
        *os << "}";
    }

    CompDesc_t compDesc;
    staticList<CompAttr_t> attrs;
};

}  // namespace tolk::cat
