#include "catalogue/tsc/TSCAsync.h"

namespace tolk {

TSCAsync::TSCAsync(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q) : TSC(target, q) {
    ErrorWaitTime = AsyncErrorWaitTime;
}

TSCAsync::~TSCAsync() {
    endDispatch();
}

TSCAsync::TSCAsync(const Instance& other) : TSC(other) {
    ErrorWaitTime = AsyncErrorWaitTime;
}

}  // namespace tolk
