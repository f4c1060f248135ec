#include "catalogue/CatBody.h"

#include "catalogue/DescValue.h"

namespace tolk::cat {

Owned::~Owned() {
    for (unsigned int i = 0; i < n_; ++i) {
        delete entries_[i].obj;
    }
}

void Owned::adopt(ValueWord* word, virtualObject* obj) {
    release(word);
    if (n_ == kMax) {
        delete obj;
        *word = 0;
        return;
    }
    entries_[n_++] = Entry{word, obj};
}

void Owned::release(ValueWord* word) {
    for (unsigned int i = 0; i < n_; ++i) {
        if (entries_[i].word == word) {
            delete entries_[i].obj;
            *word = 0;
            entries_[i] = entries_[--n_];
            return;
        }
    }
}

void Owned::clear() {
    while (n_ > 0) {
        --n_;
        delete entries_[n_].obj;
        *entries_[n_].word = 0;
    }
}

unsigned int bytesLeft(Msg* m, unsigned int off) {
    return remaining(m, off);
}

namespace {

unsigned int readNumber(const Field& f, const void* p) {
    switch (wire::width(f.typeCode)) {
        case 1:
            return *static_cast<const unsigned char*>(p);
        case 2:
            return *static_cast<const unsigned short*>(p);
        default:
            return *static_cast<const unsigned int*>(p);
    }
}

void storeNumber(const Field& f, void* p, unsigned int v) {
    switch (wire::width(f.typeCode)) {
        case 1:
            *static_cast<unsigned char*>(p) = static_cast<unsigned char>(v);
            break;
        case 2:
            *static_cast<unsigned short*>(p) = static_cast<unsigned short>(v);
            break;
        default:
            *static_cast<unsigned int*>(p) = v;
            break;
    }
}

unsigned int fixedDesc(const Field& f) {
    return wire::pack(f.typeCode, f.fixedLen);
}

// Fixed runs are char or unsigned char lists; both are one byte wide.
template <class F>
void withFixed(const Field& f, void* p, F&& fn) {
    if (f.typeCode == wire::CHAR || f.typeCode == wire::I8) {
        fn(*static_cast<staticList<char>*>(p));
    } else {
        fn(*static_cast<staticList<unsigned char>*>(p));
    }
}

}  // namespace

unsigned int writeBody(const BodyDesc& d, void* const* refs, Msg* m, unsigned int off) {
    // A counted list sends its real length: the count is stored before anything moves.
    for (unsigned int i = 0; i < d.count; ++i) {
        const Field& f = d.fields[i];
        if (f.kind == Kind::CountedList) {
            storeNumber(d.fields[f.ref], refs[f.ref], f.list->length(refs[i]));
        }
    }
    for (unsigned int i = 0; i < d.count; ++i) {
        const Field& f = d.fields[i];
        const bool first = i == 0;
        void* p = refs[i];
        switch (f.kind) {
            case Kind::Scalar: {
                unsigned int desc = wire::pack(f.typeCode);
                off = first ? putFirst(m, off, desc, p) : putField(m, off, desc, p);
                break;
            }
            case Kind::Contained:
                off = static_cast<MsgBody*>(static_cast<CompDesc_t*>(p))->writeMsg(m, off);
                break;
            case Kind::Fixed:
                withFixed(f, p, [&](auto& l) {
                    if (l.length() < f.fixedLen) {
                        l.realloc(f.fixedLen);
                    }
                    unsigned int before = off;
                    off = putField(m, off, fixedDesc(f), l.data());
                    if (first && before == 0 && off == 0) {
                        off = f.fixedLen;
                    }
                });
                break;
            case Kind::CountedList:
            case Kind::TrailingList:
                off = f.list->write(p, m, off, first);
                break;
            case Kind::DescValue:
                off = dcv::write(readNumber(d.fields[f.ref], refs[f.ref]),
                                 *static_cast<ValueWord*>(p), m, off);
                break;
            case Kind::Custom:
                off = f.custom->write(d, refs, i, m, off, first);
                break;
        }
    }
    return off;
}

unsigned int readBody(const BodyDesc& d, void* const* refs, Owned* owned, Msg* m,
                      unsigned int off) {
    for (unsigned int i = 0; i < d.count; ++i) {
        const Field& f = d.fields[i];
        const bool first = i == 0;
        void* p = refs[i];
        switch (f.kind) {
            case Kind::Scalar: {
                unsigned int desc = wire::pack(f.typeCode);
                off = first ? getFirst(m, off, desc, p) : getField(m, off, desc, p);
                break;
            }
            case Kind::Contained:
                off = static_cast<MsgBody*>(static_cast<CompDesc_t*>(p))->readMsg(m, off);
                break;
            case Kind::Fixed:
                withFixed(f, p, [&](auto& l) {
                    l.realloc(f.fixedLen);
                    unsigned int before = off;
                    off = getField(m, off, fixedDesc(f), l.data());
                    if (first && before == 0 && off == 0) {
                        off = f.fixedLen;
                    }
                });
                break;
            case Kind::CountedList: {
                unsigned int n =
                    capCount(m, off, readNumber(d.fields[f.ref], refs[f.ref]), f.list->minWire);
                f.list->resize(p, n);
                off = f.list->read(p, m, off, n, first);
                break;
            }
            case Kind::TrailingList:
                off = f.list->readToEnd(p, m, off, first);
                break;
            case Kind::DescValue:
                off = dcv::read(readNumber(d.fields[f.ref], refs[f.ref]),
                                static_cast<ValueWord*>(p), *owned, m, off);
                break;
            case Kind::Custom:
                off = f.custom->read(d, refs, i, *owned, m, off, first);
                break;
        }
    }
    return off;
}

unsigned int sizeBody(const BodyDesc& d, void* const* refs) {
    unsigned int n = 0;
    for (unsigned int i = 0; i < d.count; ++i) {
        const Field& f = d.fields[i];
        void* p = refs[i];
        switch (f.kind) {
            case Kind::Scalar:
                n += wire::width(f.typeCode);
                break;
            case Kind::Contained:
                n += 6;
                break;
            case Kind::Fixed:
                n += f.fixedLen;
                break;
            case Kind::CountedList:
            case Kind::TrailingList:
                n += f.list->byteSize(p);
                break;
            case Kind::DescValue:
                n += dcv::wireSize(readNumber(d.fields[f.ref], refs[f.ref]));
                break;
            case Kind::Custom:
                n += f.custom->size(d, refs, i);
                break;
        }
    }
    return n;
}

void printBody(const BodyDesc& d, void* const* refs, std::ostream* os) {
    *os << "{";
    for (unsigned int i = 0; i < d.count; ++i) {
        const Field& f = d.fields[i];
        const void* p = refs[i];
        if (i != 0) {
            *os << " ";
        }
        *os << f.label << " ";
        switch (f.kind) {
            case Kind::Scalar:
                if (f.typeCode == wire::I32) {
                    *os << *static_cast<const int*>(p);
                } else {
                    *os << readNumber(f, p);
                }
                break;
            case Kind::Contained:
                static_cast<const CompDesc_t*>(p)->toStream(os);
                break;
            case Kind::Fixed:
                withFixed(f, const_cast<void*>(p), [&](auto& l) { l.toStream(os); });
                break;
            case Kind::CountedList:
            case Kind::TrailingList:
                f.list->print(p, os);
                break;
            case Kind::DescValue:
                dcv::print(readNumber(d.fields[f.ref], refs[f.ref]),
                           *static_cast<const ValueWord*>(p), os);
                break;
            case Kind::Custom:
                f.custom->print(d, refs, i, os);
                break;
        }
    }
    *os << "}";
}

void copyBody(const BodyDesc& d, void* const* dst, void* const* src, Owned* owned) {
    for (unsigned int i = 0; i < d.count; ++i) {
        const Field& f = d.fields[i];
        switch (f.kind) {
            case Kind::Scalar:
                if (wire::width(f.typeCode) == 4) {
                    *static_cast<unsigned int*>(dst[i]) = *static_cast<const unsigned int*>(src[i]);
                } else {
                    storeNumber(f, dst[i], readNumber(f, src[i]));
                }
                break;
            case Kind::Contained:
                *static_cast<CompDesc_t*>(dst[i]) = *static_cast<const CompDesc_t*>(src[i]);
                break;
            case Kind::Fixed:
                withFixed(f, dst[i], [&](auto& l) {
                    using L = std::remove_reference_t<decltype(l)>;
                    l = *static_cast<const L*>(src[i]);
                });
                break;
            case Kind::CountedList:
            case Kind::TrailingList:
                f.list->assign(dst[i], src[i]);
                break;
            case Kind::DescValue:
            case Kind::Custom:
                break;
        }
    }
    // Shaped values last: their shape comes from fields copied above.
    for (unsigned int i = 0; i < d.count; ++i) {
        const Field& f = d.fields[i];
        if (f.kind == Kind::DescValue) {
            dcv::copy(readNumber(d.fields[f.ref], src[f.ref]), static_cast<ValueWord*>(dst[i]),
                      *static_cast<const ValueWord*>(src[i]), *owned);
        } else if (f.kind == Kind::Custom) {
            f.custom->copy(d, dst, src, i, *owned);
        }
    }
}

}  // namespace tolk::cat
