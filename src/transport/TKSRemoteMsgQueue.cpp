#include "transport/TKSRemoteMsgQueue.h"

#include <chrono>
#include <cstdlib>
#include <cstring>
#include <iostream>
#include <vector>

#include "transport/TKSFrame.h"
#include "transport/TKSSock.h"

namespace {

constexpr unsigned int CLOSE_WAIT_MS = 5000;
constexpr unsigned int OPEN_WAIT_MS = 5000;

int sendEmpty(sock& s, std::uint32_t type) {
    msg_t m;
    m.type = type;
    return s.snd_msg(m);
}

}  // namespace

TKSRemoteService_ComFailure::TKSRemoteService_ComFailure(const char* name, int port) : port(port) {
    hostName[0] = '\0';
    if (name != nullptr) {
        std::strncpy(hostName, name, sizeof hostName - 1);
        hostName[sizeof hostName - 1] = '\0';
    }
}

TKSRemoteMsgQueue::TKSRemoteMsgQueue(TKCompDesc addr, unsigned int maxRetMsgSize,
                                     unsigned int depth, const char* name) {
    hostName = strdup(name != nullptr ? name : "");
    port = TKS_DEFAULT_PORT;
    socket = new sock(hostName, TKS_DEFAULT_PORT);
    port = socket->getPort();
    auto fail = [this]() {
        delete socket;
        socket = nullptr;
        std::free(hostName);
        hostName = nullptr;
        throw TKSResource_CreationError();
    };
    if (socket->isFailed() || socket->connect() != 0) {
        fail();
    }
    closeSignal.lock();

    TKSOpenRequest req;
    req.addr = addr;
    req.maxRetMsgSize = maxRetMsgSize;
    req.depth = depth;
    unsigned char body[TKS_OPEN_BODY_BYTES];
    tksEncodeOpen(req, body);
    msg_t open;
    open.type = TKS_FRAME_OPEN;
    open.size = TKS_OPEN_BODY_BYTES;
    open.body = body;
    if (socket->snd_msg(open) != 0) {
        fail();
    }

    // A relay that takes the connection but never answers must not hang the program.
    if (!socket->ready('r', OPEN_WAIT_MS / 1000, 0)) {
        fail();
    }
    msg_t assigned;
    bool ok = socket->get_msg(assigned) == 0 && tksDecodeAssigned(assigned, hostDesc);
    free_msg(assigned);
    if (!ok) {
        fail();
    }
    retries = 10;
}

TKSRemoteMsgQueue::~TKSRemoteMsgQueue() {
    // Used on its own, without a reader: run the close here and collect the acknowledgement.
    if (!closeSent.load() && socket != nullptr && !socket->isFailed()) {
        if (sendClose()) {
            auto deadline =
                std::chrono::steady_clock::now() + std::chrono::milliseconds(CLOSE_WAIT_MS);
            for (;;) {
                auto left = std::chrono::duration_cast<std::chrono::milliseconds>(
                                deadline - std::chrono::steady_clock::now())
                                .count();
                if (left <= 0 || !socket->ready('r', left / 1000, (left % 1000) * 1000)) {
                    break;
                }
                msg_t m;
                int r = socket->get_msg(m);
                std::uint32_t type = m.type;
                free_msg(m);
                if (r != 0 || type == TKS_FRAME_CLOSE_ACK) {
                    break;
                }
            }
        }
    }
    delete socket;
    std::free(hostName);
}

bool TKSRemoteMsgQueue::sendClose() {
    std::lock_guard<std::mutex> lk(writeLock);
    if (closeSent.exchange(true)) {
        return false;
    }
    return sendEmpty(*socket, TKS_FRAME_CLOSE) == 0;
}

void TKSRemoteMsgQueue::closeExchange() {
    if (readerGone.load() || socket->isFailed()) {
        closeSent = true;
        return;
    }
    if (sendClose()) {
        closeSignal.tryLock(CLOSE_WAIT_MS, 10);
    }
}

void TKSRemoteMsgQueue::sendLastMessage() {
    {
        std::lock_guard<std::mutex> lk(closingLock);
        closing = true;
    }
    closingCond.notify_all();
    socket->interrupt();
}

int TKSRemoteMsgQueue::closedByRelay() {
    closeSignal.unlock();
    std::unique_lock<std::mutex> lk(closingLock);
    closingCond.wait(lk, [this] { return closing.load(); });
    return 2;
}

int TKSRemoteMsgQueue::msgWrite(TKMsg32Bit* msg) {
    std::lock_guard<std::mutex> lk(writeLock);
    if (!tksEncodeMessageFrame(msg, outFrame)) {
        return 2;
    }
    long r = socket->writeblock(outFrame.data(), static_cast<long>(outFrame.size()));
    if (r != 0 || socket->isFailed()) {
        return 2;
    }
    tkMsgFree(msg);
    return 0;
}

int TKSRemoteMsgQueue::msgRead(TKMsg32Bit** out) {
    *out = nullptr;
    if (closing.load()) {
        return 2;
    }
    msg_t m;
    m.type = TKS_FRAME_CLOSE;
    int r = socket->get_msg(m);
    if (r == 0 && m.type == TKS_FRAME_CLOSE_ACK) {
        free_msg(m);
        closeSignal.unlock();
        return 2;
    }
    if (r != 0 || m.type == TKS_FRAME_CLOSE) {
        free_msg(m);
        if (closing.load()) {
            return 2;
        }
        if (closeSent.load()) {
            return closedByRelay();
        }
        std::cerr << "Error communicating with remote message queue on " << hostName << std::endl;
        if (--retries <= 0) {
            readerGone = true;
            // A close that is waiting for its acknowledgement gets none from a dead reader.
            closeSignal.unlock();
            throw TKSRemoteService_ComFailure(hostName, port);
        }
        return 2;
    }
    if (m.type != TKS_FRAME_MESSAGE) {
        std::cerr << "Discarding a frame of unknown type " << m.type << " from " << hostName
                  << std::endl;
        free_msg(m);
        return 2;
    }
    TKMsg32Bit* block = tksBlockFromFrame(m);
    free_msg(m);
    if (block == nullptr) {
        std::cerr << "Discarding a malformed message frame from " << hostName << std::endl;
        return 2;
    }
    retries = 10;
    *out = block;
    return 0;
}
