// Random bytes into every body of the catalogue: the first byte picks the body, the rest is
// its message. Reading and printing must stay inside the message and terminate.

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>
#include <sstream>

#include "catalogue/generated/index.h"
#include "framework/Exception.h"
#include "framework/Msg.h"
#include "platform/tkhost/tkhost.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size == 0) {
        return 0;
    }
    const tolk::cat::CatalogueEntry& e = tolk::cat::kCatalogue[data[0] % tolk::cat::kCatalogueSize];
    try {
        tolk::Msg m(static_cast<unsigned int>(size - 1));
        if (size > 1) {
            std::memcpy(reinterpret_cast<std::uint8_t*>(m.getMsgRef()) + TK_MSG_HEADER_SIZE,
                        data + 1, size - 1);
        }
        std::unique_ptr<tolk::MsgBody> body(e.make());
        (void)body->readMsg(&m, 0);
        std::ostringstream os;
        body->toStream(&os);
        tolk::Msg out(body->GetByteSize());
        (void)body->writeMsg(&out, 0);
    } catch (const tolk::Exception&) {
        // An impossible size is refused by the lists; that is the expected way out.
    }
    return 0;
}
