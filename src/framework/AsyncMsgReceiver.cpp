#include "framework/AsyncMsgReceiver.h"

#include "framework/Addressable.h"

namespace tolk {

AsyncMsgReceiver::AsyncMsgReceiver(Addressable* a) : addressable(a), source(a->getTgtDesc()) {
    a->getMsgQueue()->RegisterAsyncMsgReceiver(source, this);
}

AsyncMsgReceiver::~AsyncMsgReceiver() {
    try {
        addressable->getMsgQueue()->DeregisterAsyncMsgReceiver(source);
    } catch (const Exception&) {
        // Already gone: nothing to undo.
    }
}

}  // namespace tolk
