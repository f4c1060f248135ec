#pragma once

// The `Data` of MsgError_t: a {Num, Val} record for the parameter commands, and for any other
// refused message the rest of the body as 32-bit words.

#include "catalogue/CatBody.h"

namespace tolk {
struct StdResource_Bodies;
}

namespace tolk::cat {

// Std names the message types; it is a parameter so that they are looked up where the bodies
// that include this header are complete.
template <class Outer, class Std = StdResource_Bodies>
struct ErrorData {
    using Words = staticList<unsigned int>;

    static unsigned int errorMsg(const BodyDesc& d, void* const* refs, unsigned int idx) {
        return *static_cast<const unsigned int*>(refs[d.fields[idx].ref]);
    }
    static bool isRecord(unsigned int e) {
        return e == Std::MsgSetParm_t::MsgType || e == Std::MsgSetxParms_t::MsgType ||
               e == Std::MsgGetParm_t::MsgType || e == Std::MsgGetxParms_t::MsgType ||
               e == Std::MsgGetVParm_t::MsgType || e == Std::MsgSetVParm_t::MsgType;
    }
    static MsgBody* newRecord(unsigned int e) {
        switch (e) {
            case Std::MsgSetParm_t::MsgType:
                return new typename Outer::Data_ErrorMsg_0x8_t();
            case Std::MsgSetxParms_t::MsgType:
                return new typename Outer::Data_ErrorMsg_0xa_t();
            case Std::MsgGetParm_t::MsgType:
                return new typename Outer::Data_ErrorMsg_0x12_t();
            case Std::MsgGetxParms_t::MsgType:
                return new typename Outer::Data_ErrorMsg_0x14_t();
            case Std::MsgGetVParm_t::MsgType:
                return new typename Outer::Data_ErrorMsg_0x2d_t();
            default:
                return new typename Outer::Data_ErrorMsg_0x2f_t();
        }
    }
    template <class R>
    static MsgBody* cloneAs(MsgBody* src) {
        return new R(*static_cast<R*>(src));
    }
    static MsgBody* cloneRecord(unsigned int e, MsgBody* src) {
        switch (e) {
            case Std::MsgSetParm_t::MsgType:
                return cloneAs<typename Outer::Data_ErrorMsg_0x8_t>(src);
            case Std::MsgSetxParms_t::MsgType:
                return cloneAs<typename Outer::Data_ErrorMsg_0xa_t>(src);
            case Std::MsgGetParm_t::MsgType:
                return cloneAs<typename Outer::Data_ErrorMsg_0x12_t>(src);
            case Std::MsgGetxParms_t::MsgType:
                return cloneAs<typename Outer::Data_ErrorMsg_0x14_t>(src);
            case Std::MsgGetVParm_t::MsgType:
                return cloneAs<typename Outer::Data_ErrorMsg_0x2d_t>(src);
            default:
                return cloneAs<typename Outer::Data_ErrorMsg_0x2f_t>(src);
        }
    }
    static ValueWord word(void* const* refs, unsigned int idx) {
        return *static_cast<const ValueWord*>(refs[idx]);
    }

    static unsigned int write(const BodyDesc& d, void* const* refs, unsigned int idx, Msg* m,
                              unsigned int off, bool) {
        ValueWord w = word(refs, idx);
        if (w == 0) {
            return off;
        }
        if (isRecord(errorMsg(d, refs, idx))) {
            return reinterpret_cast<MsgBody*>(w)->writeMsg(m, off);
        }
        return putList<unsigned int>(m, off, wire::U32, *reinterpret_cast<Words*>(w), false);
    }
    static unsigned int read(const BodyDesc& d, void* const* refs, unsigned int idx, Owned& owned,
                             Msg* m, unsigned int off, bool) {
        auto* w = static_cast<ValueWord*>(refs[idx]);
        owned.release(w);
        unsigned int e = errorMsg(d, refs, idx);
        if (isRecord(e)) {
            MsgBody* b = newRecord(e);
            owned.adopt(w, b);
            *w = reinterpret_cast<ValueWord>(b);
            return b->readMsg(m, off);
        }
        auto* l = new Words();
        owned.adopt(w, l);
        *w = reinterpret_cast<ValueWord>(l);
        return getList<unsigned int>(m, off, wire::U32, *l, bytesLeft(m, off) / 4, false);
    }
    static unsigned int size(const BodyDesc& d, void* const* refs, unsigned int idx) {
        ValueWord w = word(refs, idx);
        if (w == 0) {
            return 0;
        }
        if (isRecord(errorMsg(d, refs, idx))) {
            return reinterpret_cast<MsgBody*>(w)->GetByteSize();
        }
        return reinterpret_cast<Words*>(w)->length() * 4;
    }
    static void print(const BodyDesc& d, void* const* refs, unsigned int idx, std::ostream* os) {
        ValueWord w = word(refs, idx);
        if (w == 0) {
            *os << "NULL";
        } else if (isRecord(errorMsg(d, refs, idx))) {
            reinterpret_cast<MsgBody*>(w)->toStream(os);
        } else {
            reinterpret_cast<Words*>(w)->toStream(os);
        }
    }
    static void copy(const BodyDesc& d, void* const* dst, void* const* src, unsigned int idx,
                     Owned& owned) {
        auto* w = static_cast<ValueWord*>(dst[idx]);
        owned.release(w);
        ValueWord s = word(src, idx);
        if (s == 0) {
            *w = 0;
            return;
        }
        unsigned int e = errorMsg(d, src, idx);
        if (isRecord(e)) {
            MsgBody* b = cloneRecord(e, reinterpret_cast<MsgBody*>(s));
            owned.adopt(w, b);
            *w = reinterpret_cast<ValueWord>(b);
            return;
        }
        auto* l = new Words(*reinterpret_cast<Words*>(s));
        owned.adopt(w, l);
        *w = reinterpret_cast<ValueWord>(l);
    }

    static constexpr FieldOps ops{write, read, size, print, copy};
};

}  // namespace tolk::cat
