#pragma once

// One item of call information: a text for the text items, else a value shaped by `Type`.
// The same record stands under key 0x1202 of a key-value set and in the call information
// lists; each user nests its own class.

#include <ostream>

#include "catalogue/CatBody.h"
#include "catalogue/DescValue.h"

namespace tolk::cat {

inline bool isTextInfoId(unsigned int id) {
    switch (id) {
        case 2:
        case 5:
        case 7:
        case 10:
        case 14:
        case 20:
        case 22:
        case 34:
        case 37:
            return true;
        default:
            return false;
    }
}

template <class Tag>
class CallInfoRecord : public MsgBody {
  public:
    using Text = staticList<char>;
    static constexpr unsigned int kMinWireSize = 11;

    CallInfoRecord() = default;
    CallInfoRecord(const CallInfoRecord& o) : MsgBody(o) { assignFrom(o); }
    CallInfoRecord& operator=(const CallInfoRecord& o) {
        if (this != &o) {
            assignFrom(o);
        }
        return *this;
    }
    ~CallInfoRecord() override = default;

    unsigned int writeMsg(Msg* m, unsigned int off) override {
        off = putFirst(m, off, wire::pack(wire::U32), &InfoId);
        off = putGroup(m, off, wire::pack(wire::U8), &State, wire::pack(wire::WORD32), &Type,
                       wire::pack(wire::U16), &Length);
        if (isTextInfoId(InfoId)) {
            if (Value != 0) {
                off = putList<char>(m, off, wire::CHAR, *reinterpret_cast<Text*>(Value), false);
            }
            return off;
        }
        return dcv::write(Type, Value, m, off);
    }
    unsigned int readMsg(Msg* m, unsigned int off) override {
        off = getFirst(m, off, wire::pack(wire::U32), &InfoId);
        off = getGroup(m, off, wire::pack(wire::U8), &State, wire::pack(wire::WORD32), &Type,
                       wire::pack(wire::U16), &Length);
        if (!isTextInfoId(InfoId)) {
            return dcv::read(Type, &Value, owned_, m, off);
        }
        owned_.release(&Value);
        auto* t = new Text();
        owned_.adopt(&Value, t);
        Value = reinterpret_cast<ValueWord>(t);
        return getList<char>(m, off, wire::CHAR, *t, capCount(m, off, Length, 1), false);
    }
    // For a shaped value this counts four bytes an element whatever the element width: a
    // sender's buffer is then a little larger than the data, as the boards have always had it.
    unsigned int GetByteSize() override {
        if (isTextInfoId(InfoId)) {
            return 11 + (Value == 0 ? 0 : reinterpret_cast<Text*>(Value)->length());
        }
        return 11 + 4 * dcv::countOf(Type);
    }
    void toStream(std::ostream* os) const override {
        *os << "{InfoId " << InfoId << " State " << static_cast<unsigned int>(State) << " Type "
            << Type << " Length " << Length << " Value ";
        if (isTextInfoId(InfoId)) {
            if (Value == 0) {
                *os << "NULL";
            } else {
                reinterpret_cast<const Text*>(Value)->toStream(os);
            }
        } else {
            dcv::print(Type, Value, os);
        }
        *os << "}";
    }

    unsigned int InfoId = 0;
    unsigned char State = 0;
    unsigned int Type = 0;
    unsigned short Length = 0;
    ValueWord Value = 0;

  private:
    void assignFrom(const CallInfoRecord& o) {
        InfoId = o.InfoId;
        State = o.State;
        Type = o.Type;
        Length = o.Length;
        if (isTextInfoId(InfoId)) {
            owned_.release(&Value);
            if (o.Value != 0) {
                auto* t = new Text(*reinterpret_cast<const Text*>(o.Value));
                owned_.adopt(&Value, t);
                Value = reinterpret_cast<ValueWord>(t);
            }
        } else {
            dcv::copy(Type, &Value, o.Value, owned_);
        }
    }

    Owned owned_;
};

}  // namespace tolk::cat
