#pragma once

// The signal list of the signalling bodies: characters for `Format` 2 and 3, bytes for any
// other. `Count` travels as the caller set it; the list goes out as long as it is.

#include <ostream>

#include "catalogue/CatBody.h"

namespace tolk::cat {

template <class Outer>
struct SignalList {
    using Chars = staticList<char>;
    using Bytes = staticList<unsigned char>;

    static unsigned int number(const BodyDesc& d, void* const* refs, unsigned int f) {
        const void* p = refs[f];
        switch (wire::width(d.fields[f].typeCode)) {
            case 1:
                return *static_cast<const unsigned char*>(p);
            case 2:
                return *static_cast<const unsigned short*>(p);
            default:
                return *static_cast<const unsigned int*>(p);
        }
    }
    // `Format` stands right behind `Count` in every signalling body.
    static bool chars(const BodyDesc& d, void* const* refs, unsigned int idx) {
        unsigned int format = number(d, refs, d.fields[idx].ref + 1);
        return format == 2 || format == 3;
    }
    template <class F>
    static void with(const BodyDesc& d, void* const* refs, unsigned int idx, ValueWord w, F&& f) {
        if (chars(d, refs, idx)) {
            f(reinterpret_cast<Chars*>(w), wire::CHAR);
        } else {
            f(reinterpret_cast<Bytes*>(w), wire::U8);
        }
    }
    static unsigned int write(const BodyDesc& d, void* const* refs, unsigned int idx, Msg* m,
                              unsigned int off, bool) {
        ValueWord w = *static_cast<ValueWord*>(refs[idx]);
        if (w != 0) {
            with(d, refs, idx, w, [&](auto* l, unsigned int code) {
                using E = std::remove_reference_t<decltype((*l->data()))>;
                off = putList<E>(m, off, code, *l, false);
            });
        }
        return off;
    }
    static unsigned int read(const BodyDesc& d, void* const* refs, unsigned int idx, Owned& owned,
                             Msg* m, unsigned int off, bool) {
        auto* w = static_cast<ValueWord*>(refs[idx]);
        owned.release(w);
        unsigned int n = capCount(m, off, number(d, refs, d.fields[idx].ref), 1);
        if (chars(d, refs, idx)) {
            auto* l = new Chars();
            owned.adopt(w, l);
            *w = reinterpret_cast<ValueWord>(l);
            return getList<char>(m, off, wire::CHAR, *l, n, false);
        }
        auto* l = new Bytes();
        owned.adopt(w, l);
        *w = reinterpret_cast<ValueWord>(l);
        return getList<unsigned char>(m, off, wire::U8, *l, n, false);
    }
    static unsigned int size(const BodyDesc& d, void* const* refs, unsigned int idx) {
        ValueWord w = *static_cast<ValueWord*>(refs[idx]);
        unsigned int n = 0;
        if (w != 0) {
            with(d, refs, idx, w, [&](auto* l, unsigned int) { n = l->length(); });
        }
        return n;
    }
    static void print(const BodyDesc& d, void* const* refs, unsigned int idx, std::ostream* os) {
        ValueWord w = *static_cast<ValueWord*>(refs[idx]);
        if (w == 0) {
            *os << "NULL";
            return;
        }
        with(d, refs, idx, w, [&](auto* l, unsigned int) { l->toStream(os); });
    }
    static void copy(const BodyDesc& d, void* const* dst, void* const* src, unsigned int idx,
                     Owned& owned) {
        auto* w = static_cast<ValueWord*>(dst[idx]);
        owned.release(w);
        ValueWord s = *static_cast<ValueWord*>(src[idx]);
        if (s == 0) {
            *w = 0;
            return;
        }
        with(d, src, idx, s, [&](auto* l, unsigned int) {
            using L = std::remove_pointer_t<decltype(l)>;
            auto* c = new L(*l);
            owned.adopt(w, c);
            *w = reinterpret_cast<ValueWord>(c);
        });
    }

    static constexpr FieldOps ops{write, read, size, print, copy};
};

}  // namespace tolk::cat
