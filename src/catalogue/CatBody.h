#pragma once

// Table-driven marshalling shared by every body of the catalogue. catgen.py writes one
// BodyDesc per body; the walker below is the only code that turns a table into field calls.

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <ostream>
#include <type_traits>

#include "catalogue/generated/wire.h"
#include "framework/CompAttr_t.h"
#include "framework/CompDesc_t.h"
#include "framework/Marshal.h"
#include "framework/Msg.h"
#include "framework/MsgBody.h"
#include "framework/staticList.h"

namespace tolk::cat {

// Bumped whenever the meaning of the tables changes; generated files assert it.
inline constexpr unsigned int kFormatVersion = 4;

// A word that holds either a small value or the address of an object allocated by readMsg.
// It is pointer-sized so that an address survives on 64-bit hosts.
using ValueWord = std::uintptr_t;

enum class Kind : std::uint8_t {
    Scalar,        // one number, typeCode gives the width
    Contained,     // a CompDesc_t
    Fixed,         // char[n] / u8[n]
    CountedList,   // list whose length stands in field `ref`
    TrailingList,  // list that runs to the end of the message
    DescValue,     // value shaped by the descriptor word in field `ref`
    Custom,        // hand-written field, see FieldOps
};

// Operations on one staticList<T>, erased so that one walker serves every list type.
struct ListOps {
    unsigned int (*length)(const void* list);
    void (*resize)(void* list, unsigned int n);
    unsigned int (*write)(void* list, Msg* m, unsigned int off, bool first);
    // Reads exactly the first n elements (the list already has at least n).
    unsigned int (*read)(void* list, Msg* m, unsigned int off, unsigned int n, bool first);
    // Reads elements until the end of the message; the list keeps its length.
    unsigned int (*readToEnd)(void* list, Msg* m, unsigned int off, bool first);
    unsigned int (*byteSize)(const void* list);
    void (*assign)(void* dst, const void* src);
    void (*print)(const void* list, std::ostream* os);
    unsigned int minWire;  // smallest element on the wire, > 0; caps counts from the wire
    bool scalars;          // elements are numbers (a trailing run is then size / minWire)
};

class Owned;
struct BodyDesc;

// A hand-written field. `refs` are the body's field pointers, `idx` the field's own index.
struct FieldOps {
    unsigned int (*write)(const BodyDesc& d, void* const* refs, unsigned int idx, Msg* m,
                          unsigned int off, bool first);
    unsigned int (*read)(const BodyDesc& d, void* const* refs, unsigned int idx, Owned& owned,
                         Msg* m, unsigned int off, bool first);
    unsigned int (*size)(const BodyDesc& d, void* const* refs, unsigned int idx);
    void (*print)(const BodyDesc& d, void* const* refs, unsigned int idx, std::ostream* os);
    // Deep copy of the field's value from src into dst (the other fields are already copied).
    void (*copy)(const BodyDesc& d, void* const* dst, void* const* src, unsigned int idx,
                 Owned& owned);
};

struct Field {
    const char* label;
    Kind kind;
    wire::TypeCode typeCode;  // element type for numbers, fixed runs and scalar lists
    std::uint16_t fixedLen;
    std::int8_t ref;  // count field, descriptor field or the custom field's argument; -1 if none
    const ListOps* list;
    const FieldOps* custom;
};

struct BodyDesc {
    const char* name;
    unsigned int type;  // message type or event group; 0 for element bodies
    const Field* fields;
    unsigned int count;
};

// Objects that readMsg allocated for a body and that go with it. Each entry remembers the
// word that received the address so that the word can be cleared when the object goes.
class Owned {
  public:
    Owned() = default;
    Owned(const Owned&) = delete;
    Owned& operator=(const Owned&) = delete;
    // Deletes what it holds but leaves the words alone: in a generated body they are gone by now.
    ~Owned();

    void adopt(ValueWord* word, virtualObject* obj);
    // Deletes what was adopted for this word, if anything, and clears the word.
    void release(ValueWord* word);
    void clear();

  private:
    static constexpr unsigned int kMax = 4;
    struct Entry {
        ValueWord* word;
        virtualObject* obj;
    };
    Entry entries_[kMax]{};
    unsigned int n_ = 0;
};

[[nodiscard]] unsigned int writeBody(const BodyDesc& d, void* const* refs, Msg* m,
                                     unsigned int off);
[[nodiscard]] unsigned int readBody(const BodyDesc& d, void* const* refs, Owned* owned, Msg* m,
                                    unsigned int off);
[[nodiscard]] unsigned int sizeBody(const BodyDesc& d, void* const* refs);
void printBody(const BodyDesc& d, void* const* refs, std::ostream* os);
void copyBody(const BodyDesc& d, void* const* dst, void* const* src, Owned* owned);

// The field pointers of one body, in table order.
template <std::size_t N>
using Refs = std::array<void*, N>;

// A generated body: its field table (D::Desc) and its field pointers (D::refs()) are all that
// it declares; marshalling, size, text and copy come from here. Owns: some field holds an
// object that readMsg allocates (a shaped value or a hand-written field).
template <class D, bool Owns = false>
class Body : public MsgBody {
  public:
    unsigned int writeMsg(Msg* m, unsigned int off) override {
        return writeBody(D::Desc, self().refs().data(), m, off);
    }
    unsigned int readMsg(Msg* m, unsigned int off) override {
        return readBody(D::Desc, self().refs().data(), owned(), m, off);
    }
    unsigned int GetByteSize() override { return sizeBody(D::Desc, self().refs().data()); }
    void toStream(std::ostream* os) const override {
        printBody(D::Desc, const_cast<Body*>(this)->self().refs().data(), os);
    }

  protected:
    Body() = default;
    // The objects that the other body owns stay with it: copyFrom makes copies of its own.
    Body(const Body& other) : MsgBody(other) {}
    Body& operator=(const Body&) { return *this; }
    ~Body() override = default;

    // Copies the values behind the other body's pointers into the fields behind this one's.
    void copyFrom(const D& other) {
        copyBody(D::Desc, self().refs().data(), const_cast<D&>(other).refs().data(), owned());
    }
    D& assign(const D& other) {
        if (&other != &self()) {
            copyFrom(other);
        }
        return self();
    }

  private:
    struct NoObjects {};
    D& self() { return static_cast<D&>(*this); }
    Owned* owned() {
        if constexpr (Owns) {
            return &owned_;
        } else {
            return nullptr;
        }
    }
    [[no_unique_address]] std::conditional_t<Owns, Owned, NoObjects> owned_;
};

// One numbered body of a class's message or event table.
struct NumberedBody {
    unsigned int number;
    const char* name;
    MsgBody* (*make)();
};

template <class B>
MsgBody* makeBody() {
    return new B();
}

// The entry for a number in a table sorted by number, or null.
template <std::size_t N>
const NumberedBody* findNumber(const NumberedBody (&table)[N], unsigned int number) {
    const NumberedBody* end = table + N;
    const NumberedBody* at = std::lower_bound(
        table, end, number, [](const NumberedBody& e, unsigned int n) { return e.number < n; });
    return at != end && at->number == number ? at : nullptr;
}

template <class B>
MsgBody* cloneBody(const MsgBody& b) {
    return new B(static_cast<const B&>(b));
}

// Bytes left in the message behind `off`; 0 when `off` is at or beyond the end.
unsigned int bytesLeft(Msg* m, unsigned int off);

// Elements of a count from the wire that can really follow: never more than the bytes left.
inline unsigned int capCount(Msg* m, unsigned int off, unsigned int count, unsigned int minWire) {
    unsigned int fit = bytesLeft(m, off) / (minWire == 0 ? 1 : minWire);
    return count < fit ? count : fit;
}

// Reads a trailing run of contained bodies: sized to the bytes left as an upper bound, then
// read until the end of the message. Stops if an element fails to advance.
template <class T>
unsigned int readBodiesToEnd(staticList<T>& l, Msg* m, unsigned int off);

// ---- ListOps for the list types of the catalogue ----

template <class T, unsigned int Code>
struct ScalarList {
    using L = staticList<T>;
    static unsigned int length(const void* l) { return static_cast<const L*>(l)->length(); }
    static void resize(void* l, unsigned int n) { static_cast<L*>(l)->realloc(n); }
    static unsigned int write(void* l, Msg* m, unsigned int off, bool first) {
        return putList<T>(m, off, Code, *static_cast<L*>(l), first);
    }
    static unsigned int read(void* l, Msg* m, unsigned int off, unsigned int n, bool first) {
        return getList<T>(m, off, Code, *static_cast<L*>(l), n, first);
    }
    static unsigned int readToEnd(void* l, Msg* m, unsigned int off, bool first) {
        unsigned int n = bytesLeft(m, off) / wire::width(Code);
        return getList<T>(m, off, Code, *static_cast<L*>(l), n, first);
    }
    static unsigned int byteSize(const void* l) {
        return static_cast<const L*>(l)->length() * wire::width(Code);
    }
    static void assign(void* d, const void* s) { *static_cast<L*>(d) = *static_cast<const L*>(s); }
    static void print(const void* l, std::ostream* os) { static_cast<const L*>(l)->toStream(os); }
    static constexpr ListOps ops{
        length, resize, write, read, readToEnd, byteSize, assign, print, wire::width(Code), true};
};

template <class T>
struct minWireOf {
    static constexpr unsigned int value = T::kMinWireSize;
};

template <>
struct minWireOf<CompDesc_t> {
    static constexpr unsigned int value = 6;
};
template <>
struct minWireOf<CompAttr_t> {
    static constexpr unsigned int value = 8;
};

template <class T>
struct BodyList {
    using L = staticList<T>;
    static unsigned int length(const void* l) { return static_cast<const L*>(l)->length(); }
    static void resize(void* l, unsigned int n) { static_cast<L*>(l)->realloc(n); }
    static unsigned int write(void* l, Msg* m, unsigned int off, bool) {
        L& list = *static_cast<L*>(l);
        for (unsigned int i = 0; i < list.length(); ++i) {
            off = list[i]->writeMsg(m, off);
        }
        return off;
    }
    static unsigned int read(void* l, Msg* m, unsigned int off, unsigned int n, bool) {
        L& list = *static_cast<L*>(l);
        for (unsigned int i = 0; i < n; ++i) {
            off = list[i]->readMsg(m, off);
        }
        return off;
    }
    static unsigned int readToEnd(void* l, Msg* m, unsigned int off, bool) {
        return readBodiesToEnd(*static_cast<L*>(l), m, off);
    }
    static unsigned int byteSize(const void* l) {
        L& list = *const_cast<L*>(static_cast<const L*>(l));
        unsigned int n = 0;
        for (unsigned int i = 0; i < list.length(); ++i) {
            n += list[i]->GetByteSize();
        }
        return n;
    }
    static void assign(void* d, const void* s) { *static_cast<L*>(d) = *static_cast<const L*>(s); }
    static void print(const void* l, std::ostream* os) { static_cast<const L*>(l)->toStream(os); }
    static constexpr ListOps ops{
        length, resize, write, read, readToEnd, byteSize, assign, print, minWireOf<T>::value,
        false};
};

template <class T>
unsigned int readBodiesToEnd(staticList<T>& l, Msg* m, unsigned int off) {
    l.realloc(bytesLeft(m, off));
    for (unsigned int i = 0; i < l.length() && bytesLeft(m, off) > 0; ++i) {
        unsigned int next = l[i]->readMsg(m, off);
        if (next <= off) {
            break;
        }
        off = next;
    }
    return off;
}

}  // namespace tolk::cat
