#pragma once

// One information element of an ISDN message: the single-octet elements are their id alone,
// every other element carries a length and that many bytes.

#include <ostream>

#include "catalogue/CatBody.h"

namespace tolk::cat {

inline bool isSingleOctetIE(unsigned char id) {
    return id == 0x90 || id == 0xA0 || id == 0xA1 || id == 0xB0 || id == 0xBF || id == 0xD0;
}

template <class Tag>
class IsdnDataRecord : public MsgBody {
  public:
    using Bytes = staticList<unsigned char>;
    static constexpr unsigned int kMinWireSize = 1;

    IsdnDataRecord() = default;
    IsdnDataRecord(const IsdnDataRecord& o) : MsgBody(o) { assignFrom(o); }
    IsdnDataRecord& operator=(const IsdnDataRecord& o) {
        if (this != &o) {
            assignFrom(o);
        }
        return *this;
    }
    ~IsdnDataRecord() override = default;

    unsigned int writeMsg(Msg* m, unsigned int off) override {
        off = putFirst(m, off, wire::pack(wire::U8), &IEId);
        if (isSingleOctetIE(IEId)) {
            return off;
        }
        unsigned char len = static_cast<unsigned char>(Length);
        off = putField(m, off, wire::pack(wire::U8), &len);
        return Value == 0 ? off : putList<unsigned char>(m, off, wire::U8, *bytes(Value), false);
    }
    unsigned int readMsg(Msg* m, unsigned int off) override {
        off = getFirst(m, off, wire::pack(wire::U8), &IEId);
        owned_.clear();
        if (isSingleOctetIE(IEId)) {
            adopt(&Length, new Bytes());
            adopt(&Value, new Bytes());
            return off;
        }
        unsigned char len = 0;
        off = getField(m, off, wire::pack(wire::U8), &len);
        Length = len;
        auto* v = new Bytes();
        adopt(&Value, v);
        return getList<unsigned char>(m, off, wire::U8, *v, capCount(m, off, len, 1), false);
    }
    unsigned int GetByteSize() override {
        if (isSingleOctetIE(IEId)) {
            return 1;
        }
        return 2 + (Value == 0 ? 0 : bytes(Value)->length());
    }
    void toStream(std::ostream* os) const override {
        *os << "{IEId " << static_cast<unsigned int>(IEId) << " Length ";
        if (isSingleOctetIE(IEId)) {
            printList(Length, os);
        } else {
            *os << static_cast<unsigned int>(Length);
        }
        *os << " Value ";
        printList(Value, os);
        *os << "}";
    }

    unsigned char IEId = 0;
    // For a single-octet element an empty byte list, else the element's length.
    ValueWord Length = 0;
    ValueWord Value = 0;

  private:
    static Bytes* bytes(ValueWord w) { return reinterpret_cast<Bytes*>(w); }
    static void printList(ValueWord w, std::ostream* os) {
        if (w == 0) {
            *os << "NULL";
        } else {
            bytes(w)->toStream(os);
        }
    }
    void adopt(ValueWord* w, Bytes* b) {
        owned_.adopt(w, b);
        *w = reinterpret_cast<ValueWord>(b);
    }
    void assignFrom(const IsdnDataRecord& o) {
        owned_.clear();
        IEId = o.IEId;
        Length = 0;
        Value = 0;
        if (isSingleOctetIE(IEId)) {
            if (o.Length != 0) {
                adopt(&Length, new Bytes(*bytes(o.Length)));
            }
        } else {
            Length = o.Length;
        }
        if (o.Value != 0) {
            adopt(&Value, new Bytes(*bytes(o.Value)));
        }
    }

    Owned owned_;
};

}  // namespace tolk::cat
