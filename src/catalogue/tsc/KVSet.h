#pragma once

// One record of the key-value set that closes several call control commands: a key, a byte
// length and a value whose shape the key chooses.

#include <ostream>

#include "catalogue/CatBody.h"
#include "catalogue/DescValue.h"
#include "catalogue/generated/values.h"
#include "catalogue/tsc/CallInfo.h"

namespace tolk::cat {

template <class Outer>
class KVSetRecord : public MsgBody {
  public:
    class Value_Key_0x1202_t : public CallInfoRecord<Value_Key_0x1202_t> {};

    class Value_Key_0x1203_t : public MsgBody {
      public:
        static constexpr unsigned int kMinWireSize = 8;
        Value_Key_0x1203_t() = default;
        Value_Key_0x1203_t(const Value_Key_0x1203_t& o) : MsgBody(o) { assignFrom(o); }
        Value_Key_0x1203_t& operator=(const Value_Key_0x1203_t& o) {
            if (this != &o) {
                assignFrom(o);
            }
            return *this;
        }
        ~Value_Key_0x1203_t() override = default;

        bool isTerminator() const { return Id == 0 && Type == 0; }
        unsigned int writeMsg(Msg* m, unsigned int off) override {
            off = putFirst(m, off, wire::pack(wire::U32), &Id);
            off = putField(m, off, wire::pack(wire::WORD32), &Type);
            return Id == 0 ? off : dcv::write(Type, Value, m, off);
        }
        unsigned int readMsg(Msg* m, unsigned int off) override {
            off = getFirst(m, off, wire::pack(wire::U32), &Id);
            off = getField(m, off, wire::pack(wire::WORD32), &Type);
            if (Id == 0) {
                owned_.release(&Value);
                return off;
            }
            return dcv::read(Type, &Value, owned_, m, off);
        }
        unsigned int GetByteSize() override { return Id == 0 ? 8 : 8 + 4 * dcv::countOf(Type); }
        void toStream(std::ostream* os) const override {
            *os << "{Id " << Id << " Type " << Type << " Value ";
            dcv::print(Type, Value, os);
            *os << "}";
        }

        unsigned int Id = 0;
        unsigned int Type = 0;
        ValueWord Value = 0;

      private:
        void assignFrom(const Value_Key_0x1203_t& o) {
            Id = o.Id;
            Type = o.Type;
            dcv::copy(Type, &Value, o.Value, owned_);
        }
        Owned owned_;
    };

    using Bytes = staticList<unsigned char>;
    using Records = staticList<Value_Key_0x1203_t>;
    static constexpr unsigned int kMinWireSize = 8;

    KVSetRecord() = default;
    KVSetRecord(const KVSetRecord& o) : MsgBody(o) { assignFrom(o); }
    KVSetRecord& operator=(const KVSetRecord& o) {
        if (this != &o) {
            assignFrom(o);
        }
        return *this;
    }
    ~KVSetRecord() override = default;

    unsigned int writeMsg(Msg* m, unsigned int off) override {
        off = putFirst(m, off, wire::pack(wire::U32), &Key);
        off = putField(m, off, wire::pack(wire::U32), &ByteLength);
        if (Key == wire::TSC::KVKey::RECORDS) {
            // A missing list is an empty one: the receiver still needs the terminator to
            // know where the list ends.
            bool closed = false;
            if (Value != 0) {
                Records& l = records();
                for (unsigned int i = 0; i < l.length() && !closed; ++i) {
                    off = l[i]->writeMsg(m, off);
                    closed = l[i]->isTerminator();
                }
            }
            if (!closed) {
                Value_Key_0x1203_t end;
                off = end.writeMsg(m, off);
            }
            return off;
        }
        if (Key == 0 || Value == 0) {
            return off;
        }
        if (Key == wire::TSC::KVKey::CALL_INFO) {
            return reinterpret_cast<Value_Key_0x1202_t*>(Value)->writeMsg(m, off);
        }
        return putList<unsigned char>(m, off, wire::U8, *reinterpret_cast<Bytes*>(Value), false);
    }

    unsigned int readMsg(Msg* m, unsigned int off) override {
        off = getFirst(m, off, wire::pack(wire::U32), &Key);
        off = getField(m, off, wire::pack(wire::U32), &ByteLength);
        owned_.release(&Value);
        if (Key == wire::TSC::KVKey::CALL_INFO) {
            auto* v = new Value_Key_0x1202_t();
            adopt(v);
            return v->readMsg(m, off);
        }
        if (Key == wire::TSC::KVKey::RECORDS) {
            auto* l = new Records();
            adopt(l);
            // Sized to what the bytes left could hold, then cut behind the terminator.
            l->realloc(bytesLeft(m, off) / Value_Key_0x1203_t::kMinWireSize);
            unsigned int n = 0;
            while (n < l->length() && bytesLeft(m, off) > 0) {
                unsigned int next = (*l)[n]->readMsg(m, off);
                if (next <= off) {
                    break;
                }
                off = next;
                if ((*l)[n]->isTerminator()) {
                    break;
                }
                ++n;
            }
            l->realloc(n);
            return off;
        }
        auto* b = new Bytes();
        adopt(b);
        unsigned int n = Key == 0 ? 0 : capCount(m, off, ByteLength, 1);
        return getList<unsigned char>(m, off, wire::U8, *b, n, false);
    }

    unsigned int GetByteSize() override {
        if (Key == wire::TSC::KVKey::RECORDS) {
            unsigned int n = 8;
            for (unsigned int i = 0; Value != 0 && i < records().length(); ++i) {
                n += records()[i]->GetByteSize();
                if (records()[i]->isTerminator()) {
                    return n;
                }
            }
            return n + 8;
        }
        if (Key == 0 || Value == 0) {
            return 8;
        }
        if (Key == wire::TSC::KVKey::CALL_INFO) {
            return 8 + reinterpret_cast<Value_Key_0x1202_t*>(Value)->GetByteSize();
        }
        return 8 + reinterpret_cast<Bytes*>(Value)->length();
    }

    void toStream(std::ostream* os) const override {
        *os << "{Key " << Key << " ByteLength " << ByteLength << " Value ";
        if (Value == 0) {
            *os << "NULL";
        } else if (Key == wire::TSC::KVKey::CALL_INFO) {
            reinterpret_cast<const Value_Key_0x1202_t*>(Value)->toStream(os);
        } else if (Key == wire::TSC::KVKey::RECORDS) {
            reinterpret_cast<const Records*>(Value)->toStream(os);
        } else {
            reinterpret_cast<const Bytes*>(Value)->toStream(os);
        }
        *os << "}";
    }

    unsigned int Key = 0;
    unsigned int ByteLength = 0;
    ValueWord Value = 0;

  private:
    Records& records() const { return *reinterpret_cast<Records*>(Value); }
    template <class V>
    void adopt(V* v) {
        owned_.adopt(&Value, v);
        Value = reinterpret_cast<ValueWord>(v);
    }
    void assignFrom(const KVSetRecord& o) {
        Key = o.Key;
        ByteLength = o.ByteLength;
        owned_.release(&Value);
        if (o.Value == 0) {
            return;
        }
        if (Key == wire::TSC::KVKey::CALL_INFO) {
            adopt(new Value_Key_0x1202_t(*reinterpret_cast<const Value_Key_0x1202_t*>(o.Value)));
        } else if (Key == wire::TSC::KVKey::RECORDS) {
            adopt(new Records(*reinterpret_cast<const Records*>(o.Value)));
        } else {
            adopt(new Bytes(*reinterpret_cast<const Bytes*>(o.Value)));
        }
    }

    Owned owned_;
};

}  // namespace tolk::cat
