#pragma once

// Values whose shape is given by a VarFieldDesc word carried in the same record (`Type`,
// `FieldDef`): one number held in the value word, or a list of up to 256 elements whose
// address the value word holds.

#include <ostream>

#include "catalogue/CatBody.h"

namespace tolk::cat::dcv {

using wire::countOf;
using wire::isList;
using wire::typeOf;
// Bytes that the value takes on the wire.
constexpr unsigned int wireSize(unsigned int desc) {
    return wire::bytesOf(desc);
}

// Moves `n` elements at `base` in chunks of at most 255, never as a body's first field.
unsigned int putRun(Msg* m, unsigned int off, unsigned int t, const void* base, unsigned int n);
unsigned int getRun(Msg* m, unsigned int off, unsigned int t, void* base, unsigned int n);

unsigned int write(unsigned int desc, ValueWord word, Msg* m, unsigned int off);
// Releases what `owned` holds for `word`, then reads; a list is allocated and adopted.
unsigned int read(unsigned int desc, ValueWord* word, Owned& owned, Msg* m, unsigned int off);
void print(unsigned int desc, ValueWord word, std::ostream* os);
// Deep copy of a value into `dst`; a list copy is adopted by `owned`.
void copy(unsigned int desc, ValueWord* dst, ValueWord src, Owned& owned);

}  // namespace tolk::cat::dcv
