#pragma once

// The marshalling rules every body follows, in one place: the first field of a body moved alone
// (the library may hand an offset of 0 back unadvanced), lists in chunks of at most 255
// elements, trailing lists sized by what is left of the message.

#include "catalogue/generated/wire.h"
#include "framework/Exception.h"
#include "framework/Msg.h"
#include "framework/staticList.h"
#include "platform/tkhost/tkhost.h"

namespace tolk {

// A run moves in chunks of at most this many elements, one short of what a descriptor counts.
inline constexpr unsigned int MaxChunk = wire::kMaxCount - 1;

// A body's first field: moved alone, and if the offset is still 0 afterwards its width in bytes
// (element width times count) is added.
unsigned int putFirst(Msg* m, unsigned int off, unsigned int desc, const void* p);
unsigned int getFirst(Msg* m, unsigned int off, unsigned int desc, void* p);
// A later field.
unsigned int putField(Msg* m, unsigned int off, unsigned int desc, const void* p);
unsigned int getField(Msg* m, unsigned int off, unsigned int desc, void* p);

// Bytes of the message behind off; 0 if off is at or beyond the end.
unsigned int remaining(Msg* m, unsigned int off);

// Later scalar fields grouped in one library call: pairs of (descriptor, pointer).
template <class... Args>
unsigned int putGroup(Msg* m, unsigned int off, Args... descPtr) {
    static_assert(sizeof...(Args) % 2 == 0, "descriptor and pointer pairs");
    tkMsgVarFieldPut(m->getMsgRef(), static_cast<int>(sizeof...(Args) / 2), &off, descPtr...);
    return off;
}
template <class... Args>
unsigned int getGroup(Msg* m, unsigned int off, Args... descPtr) {
    static_assert(sizeof...(Args) % 2 == 0, "descriptor and pointer pairs");
    tkMsgVarFieldGet(m->getMsgRef(), static_cast<int>(sizeof...(Args) / 2), &off, descPtr...);
    return off;
}

namespace detail {

// The library moves width * count bytes through the pointer: an element type narrower than
// the type code would let it run past the list's array.
template <class T>
void checkElementWidth(unsigned int typeCode) {
    if (sizeof(T) != wire::width(typeCode)) {
        throw Exception("tolk::Marshal: list element type does not match its field type code");
    }
}

// One descriptor counts 1 to 256 elements; a larger fixed array would be cut short by the
// descriptor while the caller sized its list and GetByteSize for all of it.
inline void checkFixedCount(unsigned int n) {
    if (n > wire::kMaxCount) {
        throw Exception("tolk::Marshal: a fixed array holds at most 256 elements");
    }
}

template <class T, class Move>
unsigned int moveChunks(unsigned int off, unsigned int typeCode, staticList<T>& l, bool first,
                        Move move) {
    unsigned int n = l.length();
    if (n == 0) {
        return off;
    }
    checkElementWidth<T>(typeCode);
    unsigned int chunk = n % MaxChunk == 0 ? MaxChunk : n % MaxChunk;
    off = move(off, wire::pack(typeCode, chunk), l[0], first);
    for (unsigned int at = chunk; at < n; at += MaxChunk) {
        off = move(off, wire::pack(typeCode, MaxChunk), l[at], false);
    }
    return off;
}

}  // namespace detail

// A run of scalars in chunks of at most 255: first n mod 255 (or 255), then full chunks.
// An empty list moves nothing. `first` applies the first-field rule to the first chunk.
template <class T>
unsigned int putList(Msg* m, unsigned int off, unsigned int typeCode, staticList<T>& l,
                     bool first) {
    return detail::moveChunks(off, typeCode, l, first,
                              [m](unsigned int o, unsigned int desc, T* p, bool f) {
                                  return f ? putFirst(m, o, desc, p) : putField(m, o, desc, p);
                              });
}

// Resizes l to n (AllocationError for an impossible n), then reads it in chunks.
template <class T>
unsigned int getList(Msg* m, unsigned int off, unsigned int typeCode, staticList<T>& l,
                     unsigned int n, bool first) {
    l.realloc(n);
    return detail::moveChunks(off, typeCode, l, first,
                              [m](unsigned int o, unsigned int desc, T* p, bool f) {
                                  return f ? getFirst(m, o, desc, p) : getField(m, o, desc, p);
                              });
}

// A fixed array of n elements (at most 256): one field with the count in its descriptor.
// Writing grows a shorter list to n first and moves only the first n of a longer one; reading
// resizes to n. An array of none moves nothing.
template <class T>
unsigned int putFixed(Msg* m, unsigned int off, unsigned int typeCode, unsigned int n,
                      staticList<T>& l, bool first) {
    detail::checkFixedCount(n);
    if (n == 0) {
        return off;
    }
    if (l.length() < n) {
        l.realloc(n);
    }
    detail::checkElementWidth<T>(typeCode);
    unsigned int desc = wire::pack(typeCode, n);
    return first ? putFirst(m, off, desc, l[0]) : putField(m, off, desc, l[0]);
}
template <class T>
unsigned int getFixed(Msg* m, unsigned int off, unsigned int typeCode, unsigned int n,
                      staticList<T>& l, bool first) {
    detail::checkFixedCount(n);
    l.realloc(n);
    if (n == 0) {
        return off;
    }
    detail::checkElementWidth<T>(typeCode);
    unsigned int desc = wire::pack(typeCode, n);
    return first ? getFirst(m, off, desc, l[0]) : getField(m, off, desc, l[0]);
}

// Contained bodies, each in index order with the running offset.
template <class T>
unsigned int putBodies(Msg* m, unsigned int off, staticList<T>& l) {
    for (unsigned int i = 0; i < l.length(); ++i) {
        off = l[i]->writeMsg(m, off);
    }
    return off;
}
template <class T>
unsigned int getBodies(Msg* m, unsigned int off, staticList<T>& l, unsigned int n) {
    l.realloc(n);
    for (unsigned int i = 0; i < n; ++i) {
        off = l[i]->readMsg(m, off);
    }
    return off;
}
// A trailing list of contained bodies without a count: sized to the bytes left as an upper
// bound, then read until the offset reaches the end of the message. The list keeps the
// larger length; elements behind the last one read stay default-constructed.
template <class T>
unsigned int getTrailingBodies(Msg* m, unsigned int off, staticList<T>& l) {
    unsigned int n = remaining(m, off);
    l.realloc(n);
    unsigned int end = m->getSize();
    for (unsigned int i = 0; i < n && off < end; ++i) {
        off = l[i]->readMsg(m, off);
    }
    return off;
}

}  // namespace tolk
