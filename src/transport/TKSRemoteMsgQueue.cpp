#include "transport/TKSRemoteMsgQueue.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iostream>
#include <string>
#include <vector>

#include "transport/TKSFrame.h"
#include "transport/TKSSock.h"
#include "transport/TKSWholeLine.h"

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

TKSRemoteOpenError::TKSRemoteOpenError(const char* text, int port) : port(port) {
    std::snprintf(reason, sizeof reason, "%s", text != nullptr ? text : "");
}

TKSRemoteMsgQueue::TKSRemoteMsgQueue(TKCompDesc addr, unsigned int maxRetMsgSize,
                                     unsigned int depth, const char* name) {
    hostName = strdup(name != nullptr ? name : "");
    openRequest.addr = addr;
    openRequest.maxRetMsgSize = maxRetMsgSize;
    openRequest.depth = depth;
    std::string reason;
    std::unique_ptr<sock> opened = openConnection(hostDesc, reason);
    if (!opened) {
        std::free(hostName);
        hostName = nullptr;
        throw TKSRemoteOpenError(reason.c_str(), port);
    }
    socket = opened.release();
    closeSignal.lock();
    retries = 10;
}

namespace {

// Why part of the open's answer did not come: `got` of `wanted` bytes of it arrived.
std::string answerMissing(long result, long got, long wanted) {
    if (result == sock::SOCK_TIMED_OUT) {
        if (got == 0) {
            return "no answer to the open within " + std::to_string(OPEN_WAIT_MS / 1000) + " s";
        }
        return "incomplete answer to the open within " + std::to_string(OPEN_WAIT_MS / 1000) +
               " s (" + std::to_string(got) + " of " + std::to_string(wanted) + " bytes)";
    }
    if (got == 0) {
        return "the relay closed the connection without answering the open";
    }
    return "the relay closed the connection in the middle of its answer to the open";
}

}  // namespace

std::unique_ptr<sock> TKSRemoteMsgQueue::openConnection(TKCompDesc& assigned, std::string& reason) {
    auto s = std::make_unique<sock>(hostName, TKS_DEFAULT_PORT);
    // The same on every attempt: set once, before the reader can look at it.
    if (socket == nullptr) {
        port = s->getPort();
    }
    struct Opening {
        TKSRemoteMsgQueue* q;
        ~Opening() {
            std::lock_guard<std::mutex> lk(q->sockLock);
            q->opening = nullptr;
        }
    } registered{this};
    {
        std::lock_guard<std::mutex> lk(sockLock);
        opening = s.get();
        if (closing.load()) {
            reason = "the queue is closing";
            return nullptr;
        }
    }
    if (s->isFailed()) {
        reason = "cannot resolve the relay's host name";
        return nullptr;
    }
    // A partial answer must not hold the program any longer than no answer at all: one limit
    // for the whole exchange, connection included.
    auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(OPEN_WAIT_MS);
    if (s->connect(static_cast<int>(OPEN_WAIT_MS)) != sock::SOCK_OK) {
        reason = errno == ETIMEDOUT
                     ? "no connection within " + std::to_string(OPEN_WAIT_MS / 1000) + " s"
                     : std::string(std::strerror(errno));
        return nullptr;
    }

    unsigned char body[TKS_OPEN_BODY_BYTES];
    tksEncodeOpen(openRequest, body);
    msg_t open;
    open.type = TKS_FRAME_OPEN;
    open.size = TKS_OPEN_BODY_BYTES;
    open.body = body;
    if (s->snd_msg(open) != sock::SOCK_OK) {
        reason = "cannot send the open: the relay closed the connection";
        return nullptr;
    }

    constexpr long whole = TKS_FRAME_HEADER_SIZE + TKS_ASSIGNED_BODY_BYTES;
    unsigned char header[TKS_FRAME_HEADER_SIZE];
    long missing = 0;
    long r = s->readblock(header, TKS_FRAME_HEADER_SIZE, deadline, &missing);
    if (r != sock::SOCK_OK) {
        reason = answerMissing(r, long(TKS_FRAME_HEADER_SIZE) - missing, whole);
        return nullptr;
    }
    msg_t answer;
    tksDecodeFrameHeader(header, answer);
    // Checked before any of the body is read: an announced size that no address has is refused
    // at once instead of being waited for.
    if (answer.type != TKS_FRAME_ASSIGNED) {
        reason = "the relay answered the open with a frame of type " + std::to_string(answer.type) +
                 ", not " + std::to_string(TKS_FRAME_ASSIGNED);
        return nullptr;
    }
    if (answer.size != TKS_ASSIGNED_BODY_BYTES || answer.ex_size != 0) {
        reason = "the relay answered the open with an address of " +
                 std::to_string(std::uint64_t(answer.size) + answer.ex_size) + " bytes, not " +
                 std::to_string(TKS_ASSIGNED_BODY_BYTES);
        return nullptr;
    }
    unsigned char address[TKS_ASSIGNED_BODY_BYTES];
    r = s->readblock(address, TKS_ASSIGNED_BODY_BYTES, deadline, &missing);
    if (r != sock::SOCK_OK) {
        reason = answerMissing(r, whole - missing, whole);
        return nullptr;
    }
    answer.body = address;
    tksDecodeAssigned(answer, assigned);
    return s;
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
                if (r != sock::SOCK_OK || type == TKS_FRAME_CLOSE_ACK) {
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
    bool gone;
    {
        std::lock_guard<std::mutex> lk(sockLock);
        gone = !up.load() || socket->isFailed();
    }
    if (readerGone.load() || gone) {
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
    std::lock_guard<std::mutex> lk(sockLock);
    socket->interrupt();
    if (opening != nullptr) {
        opening->interrupt();
    }
}

int TKSRemoteMsgQueue::reconnect(const char* why) {
    up = false;
    if (connectionChanged) {
        connectionChanged(false, why);
    }
    auto pause = std::chrono::milliseconds(RECONNECT_FIRST_MS);
    for (;;) {
        {
            std::unique_lock<std::mutex> lk(closingLock);
            if (closingCond.wait_for(lk, pause, [this] { return closing.load(); })) {
                return TKS_NOT_MOVED;
            }
        }
        std::string reason;
        TKCompDesc assigned{};
        std::unique_ptr<sock> fresh = openConnection(assigned, reason);
        if (fresh) {
            sock* old;
            {
                std::lock_guard<std::mutex> w(writeLock);
                std::lock_guard<std::mutex> lk(sockLock);
                old = socket;
                socket = fresh.release();
                if (closing.load()) {
                    socket->interrupt();
                }
                hostDesc = assigned;
            }
            delete old;
            retries = 10;
            up = true;
            if (connectionChanged) {
                connectionChanged(true, "");
            }
            return TKS_NOT_MOVED;
        }
        pause = std::min(pause * 2, std::chrono::milliseconds(RECONNECT_MAX_MS));
    }
}

int TKSRemoteMsgQueue::closedByRelay() {
    closeSignal.unlock();
    std::unique_lock<std::mutex> lk(closingLock);
    closingCond.wait(lk, [this] { return closing.load(); });
    return TKS_NOT_MOVED;
}

int TKSRemoteMsgQueue::msgWrite(TKMsg32Bit* msg) {
    std::lock_guard<std::mutex> lk(writeLock);
    if (!up.load()) {
        return TKS_NOT_MOVED;
    }
    if (!tksEncodeMessageFrame(msg, outFrame)) {
        return TKS_NOT_MOVED;
    }
    // Judged by this write alone: the reader marks the socket failed when the relay closes,
    // which may come just after the relay has read this very message.
    long r = socket->writeblock(outFrame.data(), static_cast<long>(outFrame.size()));
    if (r != sock::SOCK_OK) {
        return TKS_NOT_MOVED;
    }
    tkMsgFree(msg);
    return TKS_OK;
}

int TKSRemoteMsgQueue::msgRead(TKMsg32Bit** out) {
    *out = nullptr;
    if (closing.load()) {
        return TKS_NOT_MOVED;
    }
    msg_t m;
    m.type = TKS_FRAME_CLOSE;
    int r = socket->get_msg(m);
    if (r == sock::SOCK_OK && m.type == TKS_FRAME_CLOSE_ACK) {
        free_msg(m);
        closeSignal.unlock();
        return TKS_NOT_MOVED;
    }
    if (r != sock::SOCK_OK || m.type == TKS_FRAME_CLOSE) {
        free_msg(m);
        if (closing.load()) {
            return TKS_NOT_MOVED;
        }
        if (closeSent.load()) {
            return closedByRelay();
        }
        TKSWholeLine() << "Error communicating with remote message queue on " << hostName
                       << std::endl;
        // A broken connection fails every read at once: no use counting those. A frame that
        // was refused leaves the stream in step; only a run of them gives the connection up.
        if (socket->isFailed()) {
            return reconnect("the connection was closed or broke");
        }
        if (--retries <= 0) {
            return reconnect("ten frames in a row could not be read");
        }
        return TKS_NOT_MOVED;
    }
    if (m.type != TKS_FRAME_MESSAGE) {
        TKSWholeLine() << "Discarding a frame of unknown type " << m.type << " from " << hostName
                       << std::endl;
        free_msg(m);
        return TKS_NOT_MOVED;
    }
    TKMsg32Bit* block = tksBlockFromFrame(m);
    free_msg(m);
    if (block == nullptr) {
        TKSWholeLine() << "Discarding a malformed message frame from " << hostName << std::endl;
        return TKS_NOT_MOVED;
    }
    retries = 10;
    *out = block;
    return TKS_OK;
}
