#pragma once

// `Value` of the general call information event: 128 characters for the text types, else
// one number held in the word itself.

#include "catalogue/CatBody.h"
#include "catalogue/generated/values.h"

namespace tolk::cat {

inline bool isTextCallInfoType(unsigned int type) {
    switch (type - wire::TSC::EvtType::CALL_INFO_CALLER_ID) {
        case 0:
        case 3:
        case 5:
        case 8:
        case 12:
        case 18:
        case 20:
            return true;
        default:
            return false;
    }
}

template <class Outer>
struct CallInfoEvtValue {
    using Text = staticList<char>;
    static constexpr unsigned int kTextDesc = wire::pack(wire::CHAR, 128);

    static bool text(const BodyDesc& d, void* const* refs, unsigned int idx) {
        return isTextCallInfoType(*static_cast<const unsigned int*>(refs[d.fields[idx].ref]));
    }
    static unsigned int write(const BodyDesc& d, void* const* refs, unsigned int idx, Msg* m,
                              unsigned int off, bool) {
        ValueWord w = *static_cast<ValueWord*>(refs[idx]);
        if (!text(d, refs, idx)) {
            unsigned int v = static_cast<unsigned int>(w);
            return putField(m, off, wire::pack(wire::U32), &v);
        }
        Text zeros;
        Text& t = w == 0 ? zeros : *reinterpret_cast<Text*>(w);
        if (t.length() < 128) {
            t.realloc(128);
        }
        return putField(m, off, kTextDesc, t.data());
    }
    static unsigned int read(const BodyDesc& d, void* const* refs, unsigned int idx, Owned& owned,
                             Msg* m, unsigned int off, bool) {
        auto* w = static_cast<ValueWord*>(refs[idx]);
        owned.release(w);
        if (!text(d, refs, idx)) {
            unsigned int v = 0;
            off = getField(m, off, wire::pack(wire::U32), &v);
            *w = v;
            return off;
        }
        auto* t = new Text();
        owned.adopt(w, t);
        *w = reinterpret_cast<ValueWord>(t);
        t->realloc(128);
        return getField(m, off, kTextDesc, t->data());
    }
    static unsigned int size(const BodyDesc& d, void* const* refs, unsigned int idx) {
        return text(d, refs, idx) ? 128 : 4;
    }
    static void print(const BodyDesc& d, void* const* refs, unsigned int idx, std::ostream* os) {
        ValueWord w = *static_cast<ValueWord*>(refs[idx]);
        if (!text(d, refs, idx)) {
            *os << static_cast<unsigned int>(w);
        } else if (w == 0) {
            *os << "NULL";
        } else {
            reinterpret_cast<const Text*>(w)->toStream(os);
        }
    }
    static void copy(const BodyDesc& d, void* const* dst, void* const* src, unsigned int idx,
                     Owned& owned) {
        auto* w = static_cast<ValueWord*>(dst[idx]);
        owned.release(w);
        ValueWord s = *static_cast<ValueWord*>(src[idx]);
        if (!text(d, src, idx) || s == 0) {
            *w = s;
            return;
        }
        auto* t = new Text(*reinterpret_cast<const Text*>(s));
        owned.adopt(w, t);
        *w = reinterpret_cast<ValueWord>(t);
    }

    static constexpr FieldOps ops{write, read, size, print, copy};
};

}  // namespace tolk::cat
