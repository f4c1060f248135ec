#include "catalogue/DescValue.h"

#include <cstring>
#include <type_traits>

namespace tolk::cat::dcv {

namespace {

template <class T>
void printList(const staticList<T>* l, std::ostream* os) {
    l->toStream(os);
}

}  // namespace

unsigned int putRun(Msg* m, unsigned int off, unsigned int t, const void* base, unsigned int n) {
    if (n == 0) {
        return off;
    }
    const unsigned char* p = static_cast<const unsigned char*>(base);
    unsigned int w = wire::width(t);
    unsigned int chunk = n % MaxChunk == 0 ? MaxChunk : n % MaxChunk;
    off = putField(m, off, wire::pack(t, chunk), p);
    p += chunk * w;
    for (unsigned int done = chunk; done < n; done += MaxChunk, p += MaxChunk * w) {
        off = putField(m, off, wire::pack(t, MaxChunk), p);
    }
    return off;
}

unsigned int getRun(Msg* m, unsigned int off, unsigned int t, void* base, unsigned int n) {
    if (n == 0) {
        return off;
    }
    unsigned char* p = static_cast<unsigned char*>(base);
    unsigned int w = wire::width(t);
    unsigned int chunk = n % MaxChunk == 0 ? MaxChunk : n % MaxChunk;
    off = getField(m, off, wire::pack(t, chunk), p);
    p += chunk * w;
    for (unsigned int done = chunk; done < n; done += MaxChunk, p += MaxChunk * w) {
        off = getField(m, off, wire::pack(t, MaxChunk), p);
    }
    return off;
}

unsigned int write(unsigned int desc, ValueWord word, Msg* m, unsigned int off) {
    unsigned int t = typeOf(desc);
    unsigned int n = countOf(desc);
    if (n == 1) {
        unsigned int w = wire::width(t);
        unsigned char b = static_cast<unsigned char>(word);
        unsigned short h = static_cast<unsigned short>(word);
        unsigned int v = static_cast<unsigned int>(word);
        const void* p = w == 1   ? static_cast<const void*>(&b)
                        : w == 2 ? static_cast<const void*>(&h)
                                 : static_cast<const void*>(&v);
        return putField(m, off, wire::pack(t), p);
    }
    unsigned int result = off;
    wire::withCType(t, [&](auto* tag) {
        using E = std::remove_pointer_t<decltype(tag)>;
        auto* l = reinterpret_cast<staticList<E>*>(word);
        if (l == nullptr) {
            staticList<E> zeros;
            zeros.realloc(n);
            result = putRun(m, off, t, zeros.data(), n);
            return;
        }
        if (l->length() < n) {
            l->realloc(n);
        }
        result = putRun(m, off, t, l->data(), n);
    });
    return result;
}

unsigned int read(unsigned int desc, ValueWord* word, Owned& owned, Msg* m, unsigned int off) {
    owned.release(word);
    unsigned int t = typeOf(desc);
    unsigned int n = countOf(desc);
    if (n == 1) {
        unsigned int w = wire::width(t);
        unsigned char b = 0;
        unsigned short h = 0;
        unsigned int v = 0;
        void* p = w == 1   ? static_cast<void*>(&b)
                  : w == 2 ? static_cast<void*>(&h)
                           : static_cast<void*>(&v);
        off = getField(m, off, wire::pack(t), p);
        *word = w == 1 ? b : w == 2 ? h : v;
        return off;
    }
    wire::withCType(t, [&](auto* tag) {
        using E = std::remove_pointer_t<decltype(tag)>;
        auto* l = new staticList<E>();
        owned.adopt(word, l);
        *word = reinterpret_cast<ValueWord>(l);
        l->realloc(n);
        off = getRun(m, off, t, l->data(), n);
    });
    return off;
}

void print(unsigned int desc, ValueWord word, std::ostream* os) {
    if (!isList(desc)) {
        *os << static_cast<unsigned int>(word);
        return;
    }
    if (word == 0) {
        *os << "NULL";
        return;
    }
    wire::withCType(typeOf(desc), [&](auto* tag) {
        using E = std::remove_pointer_t<decltype(tag)>;
        printList(reinterpret_cast<const staticList<E>*>(word), os);
    });
}

void copy(unsigned int desc, ValueWord* dst, ValueWord src, Owned& owned) {
    owned.release(dst);
    if (!isList(desc) || src == 0) {
        *dst = src;
        return;
    }
    wire::withCType(typeOf(desc), [&](auto* tag) {
        using E = std::remove_pointer_t<decltype(tag)>;
        auto* l = new staticList<E>(*reinterpret_cast<const staticList<E>*>(src));
        owned.adopt(dst, l);
        *dst = reinterpret_cast<ValueWord>(l);
    });
}

}  // namespace tolk::cat::dcv
