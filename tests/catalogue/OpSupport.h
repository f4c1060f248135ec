#pragma once

// Shared by the operation tests: short waits, a private queue, the board's fixed addresses.

#include <gtest/gtest.h>

#include <cstdint>
#include <sstream>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "FakeBoard.h"
#include "catalogue/stdresource/StdResource.h"
#include "framework/MsgQueue.h"
#include "framework/String.h"
#include "transport/IsaSync.h"

using Bytes = std::vector<std::uint8_t>;

// A component class with its waits cut short, so that silence costs little.
template <class T>
class Quick : public T {
  public:
    template <class... A>
    explicit Quick(A&&... a) : T(std::forward<A>(a)...) {
        this->ResponseTimeout = 300;
        this->ErrorWaitTime = 100;
    }
    // As the most derived class, it ends the delivery of stray messages before its own part
    // goes, as every class of the resource family does.
    ~Quick() override {
        if constexpr (std::is_base_of_v<tolk::StdResource, T>) {
            this->endDispatch();
        }
    }
};

inline isa::RefPtr<tolk::MsgQueue> newQueue() {
    return isa::RefPtr<tolk::MsgQueue>(
        new tolk::MsgQueue(tolk::CompDesc_t(1, 1, 1, 1, 1), 1024, 5));
}

// A channel component on board 2, node 0; its services stand at fixed instances there.
inline const tolk::CompDesc_t kTarget(3, 2, 1, 18, 0);
inline const tolk::CompDesc_t kResourceMgr(5, 2, 1, 0, 0);
inline const tolk::CompDesc_t kClusterMgr(8, 2, 1, 0, 0);

inline std::string textOf(const tolk::virtualObject& o) {
    std::ostringstream os;
    o.toStream(&os);
    return os.str();
}

inline Bytes concat(std::initializer_list<Bytes> parts) {
    Bytes out;
    for (const Bytes& p : parts) {
        out.insert(out.end(), p.begin(), p.end());
    }
    return out;
}

inline Bytes u32(unsigned int v) {
    Bytes b;
    put32(b, v);
    return b;
}

inline Bytes desc(const tolk::CompDesc_t& d) {
    Bytes b;
    putDesc(b, d);
    return b;
}
