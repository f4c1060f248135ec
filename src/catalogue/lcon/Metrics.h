#pragma once

// The variant part of MsgGetMetricsCmplt_t: `Type` 0x1616 carries an interval record and
// three-number metric records, any other type two-number records and no interval.

#include <ostream>

#include "catalogue/CatBody.h"
#include "catalogue/generated/values.h"

namespace tolk::cat {

inline constexpr unsigned int kIntervalMetrics = wire::LCON::MetricsType::INTERVAL;

template <class Outer>
struct MetricsInterval {
    using Interval = typename Outer::IntervalInfo_Type_0x1616_t;
    using Bytes = staticList<unsigned char>;

    static bool interval(const BodyDesc& d, void* const* refs, unsigned int idx) {
        return *static_cast<const unsigned int*>(refs[d.fields[idx].ref]) == kIntervalMetrics;
    }
    static unsigned int write(const BodyDesc& d, void* const* refs, unsigned int idx, Msg* m,
                              unsigned int off, bool) {
        if (!interval(d, refs, idx)) {
            return off;
        }
        ValueWord w = *static_cast<ValueWord*>(refs[idx]);
        Interval zero;
        return (w == 0 ? &zero : reinterpret_cast<Interval*>(w))->writeMsg(m, off);
    }
    static unsigned int read(const BodyDesc& d, void* const* refs, unsigned int idx, Owned& owned,
                             Msg* m, unsigned int off, bool) {
        auto* w = static_cast<ValueWord*>(refs[idx]);
        owned.release(w);
        if (!interval(d, refs, idx)) {
            auto* b = new Bytes();
            owned.adopt(w, b);
            *w = reinterpret_cast<ValueWord>(b);
            return off;
        }
        auto* i = new Interval();
        owned.adopt(w, i);
        *w = reinterpret_cast<ValueWord>(i);
        return i->readMsg(m, off);
    }
    static unsigned int size(const BodyDesc& d, void* const* refs, unsigned int idx) {
        // Every field of the interval record is a fixed number: its least size is its size.
        return interval(d, refs, idx) ? Interval::kMinWireSize : 0;
    }
    static void print(const BodyDesc& d, void* const* refs, unsigned int idx, std::ostream* os) {
        ValueWord w = *static_cast<ValueWord*>(refs[idx]);
        if (w == 0) {
            *os << "NULL";
        } else if (interval(d, refs, idx)) {
            reinterpret_cast<const Interval*>(w)->toStream(os);
        } else {
            reinterpret_cast<const Bytes*>(w)->toStream(os);
        }
    }
    static void copy(const BodyDesc& d, void* const* dst, void* const* src, unsigned int idx,
                     Owned& owned) {
        auto* w = static_cast<ValueWord*>(dst[idx]);
        owned.release(w);
        ValueWord s = *static_cast<ValueWord*>(src[idx]);
        if (s == 0) {
            *w = 0;
        } else if (interval(d, src, idx)) {
            auto* i = new Interval(*reinterpret_cast<const Interval*>(s));
            owned.adopt(w, i);
            *w = reinterpret_cast<ValueWord>(i);
        } else {
            auto* b = new Bytes(*reinterpret_cast<const Bytes*>(s));
            owned.adopt(w, b);
            *w = reinterpret_cast<ValueWord>(b);
        }
    }

    static constexpr FieldOps ops{write, read, size, print, copy};
};

// The records: `Count` of them on reading; on writing every record of the list goes out and
// `Count` keeps the caller's value.
template <class Outer>
struct MetricsList {
    using LongRecord = typename Outer::Metrics_Type_0x1616_t;
    using ShortRecord = typename Outer::Metrics_Type_default_t;
    using Long = staticList<LongRecord>;
    using Short = staticList<ShortRecord>;

    static bool isLong(void* const* refs) {
        return *static_cast<const unsigned int*>(refs[0]) == kIntervalMetrics;
    }
    template <class F>
    static void with(void* const* refs, ValueWord w, F&& f) {
        if (isLong(refs)) {
            f(reinterpret_cast<Long*>(w));
        } else {
            f(reinterpret_cast<Short*>(w));
        }
    }
    static unsigned int write(const BodyDesc&, void* const* refs, unsigned int idx, Msg* m,
                              unsigned int off, bool) {
        ValueWord w = *static_cast<ValueWord*>(refs[idx]);
        if (w != 0) {
            with(refs, w, [&](auto* l) { off = putBodies(m, off, *l); });
        }
        return off;
    }
    static unsigned int read(const BodyDesc& d, void* const* refs, unsigned int idx, Owned& owned,
                             Msg* m, unsigned int off, bool) {
        auto* w = static_cast<ValueWord*>(refs[idx]);
        owned.release(w);
        unsigned int count = *static_cast<const unsigned int*>(refs[d.fields[idx].ref]);
        if (isLong(refs)) {
            auto* l = new Long();
            owned.adopt(w, l);
            *w = reinterpret_cast<ValueWord>(l);
            return getBodies(m, off, *l, capCount(m, off, count, LongRecord::kMinWireSize));
        }
        auto* l = new Short();
        owned.adopt(w, l);
        *w = reinterpret_cast<ValueWord>(l);
        return getBodies(m, off, *l, capCount(m, off, count, ShortRecord::kMinWireSize));
    }
    static unsigned int size(const BodyDesc&, void* const* refs, unsigned int idx) {
        ValueWord w = *static_cast<ValueWord*>(refs[idx]);
        if (w == 0) {
            return 0;
        }
        unsigned int n = 0;
        with(refs, w, [&](auto* l) {
            for (unsigned int i = 0; i < l->length(); ++i) {
                n += (*l)[i]->GetByteSize();
            }
        });
        return n;
    }
    static void print(const BodyDesc&, void* const* refs, unsigned int idx, std::ostream* os) {
        ValueWord w = *static_cast<ValueWord*>(refs[idx]);
        if (w == 0) {
            *os << "NULL";
            return;
        }
        with(refs, w, [&](auto* l) { l->toStream(os); });
    }
    static void copy(const BodyDesc&, void* const* dst, void* const* src, unsigned int idx,
                     Owned& owned) {
        auto* w = static_cast<ValueWord*>(dst[idx]);
        owned.release(w);
        ValueWord s = *static_cast<ValueWord*>(src[idx]);
        if (s == 0) {
            *w = 0;
            return;
        }
        with(src, s, [&](auto* l) {
            using L = std::remove_pointer_t<decltype(l)>;
            auto* c = new L(*l);
            owned.adopt(w, c);
            *w = reinterpret_cast<ValueWord>(c);
        });
    }

    static constexpr FieldOps ops{write, read, size, print, copy};
};

}  // namespace tolk::cat
