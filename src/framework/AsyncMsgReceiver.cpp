#include "framework/AsyncMsgReceiver.h"

#include "framework/Addressable.h"

namespace tolk {

AsyncMsgReceiver::AsyncMsgReceiver(Addressable* a) : addressable(a), source(a->getTgtDesc()) {
    registerReceiver();
}

AsyncMsgReceiver::AsyncMsgReceiver(Addressable* a, Deferred)
    : addressable(a), source(a->getTgtDesc()) {}

void AsyncMsgReceiver::registerReceiver() {
    addressable->getMsgQueue()->RegisterAsyncMsgReceiver(source, this);
    registered = true;
}

void AsyncMsgReceiver::deregisterReceiver() {
    if (!registered) {
        return;
    }
    registered = false;
    try {
        addressable->getMsgQueue()->DeregisterAsyncMsgReceiver(source);
    } catch (const Exception&) {
        // Already gone: nothing to undo.
    }
}

AsyncMsgReceiver::~AsyncMsgReceiver() {
    deregisterReceiver();
}

}  // namespace tolk
