// Frames from an untrusted relay: whatever the bytes, reading them must neither crash nor read
// out of bounds, and a frame that passes must turn into a block only if it is well formed.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include "transport/TKSFrame.h"

namespace {

class FuzzSource : public TKSByteSource {
  public:
    FuzzSource(const std::uint8_t* data, std::size_t size) : data(data), size(size) {}
    int readExact(void* dst, std::size_t n) override {
        if (size - pos < n) {
            pos = size;
            return -1;
        }
        std::memcpy(dst, data + pos, n);
        pos += n;
        return 0;
    }

  private:
    const std::uint8_t* data;
    std::size_t size;
    std::size_t pos = 0;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    FuzzSource src(data, size);
    for (int frames = 0; frames < 64; ++frames) {
        msg_t m;
        TKSReadResult r = tksReadFrame(src, m);
        if (r == TKS_READ_FAILED) {
            break;
        }
        if (r != TKS_READ_OK) {
            continue;
        }
        if (TKMsg32Bit* b = tksBlockFromFrame(m)) {
            std::vector<unsigned char> again;
            if (!tksEncodeMessageFrame(b, again) ||
                again.size() != TKS_FRAME_HEADER_SIZE + TKS_MSG_HEADER_BYTES + b->size) {
                __builtin_trap();
            }
            tkMsgFree(b);
        }
        TKCompDesc addr{};
        tksDecodeAssigned(m, addr);
        TKSOpenRequest req;
        tksDecodeOpen(m, req);
        free_msg(m);
    }
    return 0;
}
