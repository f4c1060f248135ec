#include "sim/RelayServer.h"

#include <arpa/inet.h>
#include <errno.h>
#include <fcntl.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/epoll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <ostream>
#include <string_view>

#include "platform/tkhost/tkhost_switch.h"
#include "sim/Trace.h"
#include "transport/TKSFrame.h"

namespace sim {

namespace {

constexpr std::size_t kBurstSlice = 512;
// Bursts wait while any client has this much unsent.
constexpr std::size_t kBurstWatermark = 1u << 20;

bool setNonBlocking(int fd) {
    int flags = fcntl(fd, F_GETFL, 0);
    return flags >= 0 && fcntl(fd, F_SETFL, flags | O_NONBLOCK) == 0;
}

bool isHostAddress(const TKCompDesc& a) {
    return a.board == TK_HOST_BOARD;
}

}  // namespace

RelayServer::RelayServer(std::shared_ptr<const farm::Farm> farm, RelayOptions options,
                         std::ostream& log)
    : options_(std::move(options)), log_(log), emu_(std::move(farm), log) {}

RelayServer::~RelayServer() {
    for (auto& [fd, c] : conns_) {
        ::close(fd);
    }
    if (listenFd_ >= 0) {
        ::close(listenFd_);
    }
    if (epollFd_ >= 0) {
        ::close(epollFd_);
    }
    if (wakeFd_ >= 0) {
        ::close(wakeFd_);
    }
    if (spareFd_ >= 0) {
        ::close(spareFd_);
    }
}

bool RelayServer::listen(std::string& error) {
    listenFd_ = ::socket(AF_INET, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0);
    if (listenFd_ < 0) {
        error = std::string("socket: ") + std::strerror(errno);
        return false;
    }
    int one = 1;
    setsockopt(listenFd_, SOL_SOCKET, SO_REUSEADDR, &one, sizeof one);
    sockaddr_in sa{};
    sa.sin_family = AF_INET;
    sa.sin_port = htons(static_cast<std::uint16_t>(options_.port));
    if (inet_pton(AF_INET, options_.bindAddress.c_str(), &sa.sin_addr) != 1) {
        error = "not an IPv4 address: " + options_.bindAddress;
        return false;
    }
    if (::bind(listenFd_, reinterpret_cast<sockaddr*>(&sa), sizeof sa) != 0) {
        error = "bind to port " + std::to_string(options_.port) + ": " + std::strerror(errno);
        return false;
    }
    if (::listen(listenFd_, 512) != 0) {
        error = std::string("listen: ") + std::strerror(errno);
        return false;
    }
    socklen_t len = sizeof sa;
    getsockname(listenFd_, reinterpret_cast<sockaddr*>(&sa), &len);
    port_ = ntohs(sa.sin_port);

    epollFd_ = epoll_create1(EPOLL_CLOEXEC);
    wakeFd_ = eventfd(0, EFD_NONBLOCK | EFD_CLOEXEC);
    spareFd_ = ::open("/dev/null", O_RDONLY | O_CLOEXEC);
    if (epollFd_ < 0 || wakeFd_ < 0) {
        error = std::string("epoll/eventfd: ") + std::strerror(errno);
        return false;
    }
    epoll_event ev{};
    ev.events = EPOLLIN;
    ev.data.fd = listenFd_;
    epoll_ctl(epollFd_, EPOLL_CTL_ADD, listenFd_, &ev);
    ev.data.fd = wakeFd_;
    epoll_ctl(epollFd_, EPOLL_CTL_ADD, wakeFd_, &ev);
    return true;
}

void RelayServer::run(int controlFd, std::ostream* controlOut) {
    if (controlFd >= 0) {
        setNonBlocking(controlFd);
        epoll_event ev{};
        ev.events = EPOLLIN;
        ev.data.fd = controlFd;
        if (epoll_ctl(epollFd_, EPOLL_CTL_ADD, controlFd, &ev) != 0) {
            // A regular file or /dev/null cannot be polled: read it all now.
            readControl(controlFd, controlOut);
            controlFd = -1;
        }
    }
    running_ = !stopRequested_.load();
    scriptNext_ = 0;
    scriptDue_ = Clock::now();
    playScript(scriptDue_);
    epoll_event events[256];
    while (running_) {
        int n = epoll_wait(epollFd_, events, 256, timeoutMs());
        if (n < 0 && errno != EINTR) {
            log_ << "vx7sim: epoll_wait: " << std::strerror(errno) << std::endl;
            break;
        }
        for (int i = 0; i < n; ++i) {
            int fd = events[i].data.fd;
            if (fd == listenFd_) {
                acceptAll();
            } else if (fd == wakeFd_) {
                std::uint64_t v;
                while (::read(wakeFd_, &v, sizeof v) > 0) {
                }
                runCrossThread();
            } else if (fd == controlFd) {
                readControl(controlFd, controlOut);
                if (events[i].events & (EPOLLHUP | EPOLLERR)) {
                    // End of the control input; the relay goes on serving.
                    epoll_ctl(epollFd_, EPOLL_CTL_DEL, controlFd, nullptr);
                    controlFd = -1;
                }
            } else {
                auto it = conns_.find(fd);
                if (it == conns_.end() || it->second->dead) {
                    continue;
                }
                Conn& c = *it->second;
                if (events[i].events & (EPOLLIN | EPOLLHUP | EPOLLERR)) {
                    readFrom(c);
                }
                if (!c.dead && (events[i].events & EPOLLOUT)) {
                    flush(c);
                }
            }
        }
        if (stopRequested_.load()) {
            running_ = false;
        }
        expireUnopened(Clock::now());
        playScript(Clock::now());
        drainEmulation();
        pumpBursts();
        flushAll();
        reap();
    }
    dropAll();
    reap();
    runCrossThread();
}

int RelayServer::timeoutMs() const {
    if (emu_.burstsPending() && outputRoom()) {
        return 0;
    }
    auto due = emu_.nextDue();
    if (scriptNext_ < script_.size() && (!due || scriptDue_ < *due)) {
        due = scriptDue_;
    }
    if (!unopened_.empty()) {
        Clock::time_point expiry = unopened_.begin()->second->accepted + options_.openTimeout;
        if (!due || expiry < *due) {
            due = expiry;
        }
    }
    if (!due) {
        return emu_.burstsPending() ? 10 : -1;
    }
    auto wait = std::chrono::duration_cast<std::chrono::milliseconds>(*due - Clock::now()).count();
    return wait <= 0 ? 0 : static_cast<int>(std::min<long long>(wait + 1, 60'000));
}

std::uint16_t RelayServer::nextInstance() {
    for (int tries = 0; tries < 65535; ++tries) {
        lastInstance_ = static_cast<std::uint16_t>(lastInstance_ == 65535 ? 1 : lastInstance_ + 1);
        if (!byInstance_.count(lastInstance_)) {
            return lastInstance_;
        }
    }
    return 0;
}

void RelayServer::acceptAll() {
    for (;;) {
        int fd = ::accept4(listenFd_, nullptr, nullptr, SOCK_NONBLOCK | SOCK_CLOEXEC);
        if (fd < 0) {
            if (errno == EINTR || errno == ECONNABORTED) {
                continue;
            }
            if ((errno == EMFILE || errno == ENFILE) && spareFd_ >= 0) {
                // Level-triggered: a connection left waiting would wake the loop at once, again
                // and again. Refuse it with the spare descriptor and keep serving the others.
                ::close(spareFd_);
                int refused = ::accept4(listenFd_, nullptr, nullptr, SOCK_CLOEXEC);
                if (refused >= 0) {
                    log_ << "vx7sim: out of descriptors, refusing a connection" << std::endl;
                    ::close(refused);
                }
                spareFd_ = ::open("/dev/null", O_RDONLY | O_CLOEXEC);
                if (refused >= 0) {
                    continue;
                }
            }
            return;
        }
        makeRoomForNewcomer();
        if (liveConnections() >= options_.maxConnections) {
            log_ << "vx7sim: refusing a connection: " << liveConnections() << " already open"
                 << std::endl;
            ::close(fd);
            continue;
        }
        int one = 1;
        setsockopt(fd, IPPROTO_TCP, TCP_NODELAY, &one, sizeof one);
        auto c = std::make_unique<Conn>(fd, ++serial_, Clock::now());
        epoll_event ev{};
        ev.events = EPOLLIN;
        ev.data.fd = fd;
        if (epoll_ctl(epollFd_, EPOLL_CTL_ADD, fd, &ev) != 0) {
            ::close(fd);
            continue;
        }
        unopened_[c->serial] = c.get();
        conns_[fd] = std::move(c);
        connectionCount_.store(liveConnections());
    }
}

void RelayServer::makeRoomForNewcomer() {
    std::size_t unopenedShare = options_.maxConnections > options_.reservedForOpen
                                    ? options_.maxConnections - options_.reservedForOpen
                                    : 1;
    // A newcomer is as likely to open as the oldest idle connection is unlikely to by now.
    while (!unopened_.empty() &&
           (unopened_.size() >= unopenedShare || liveConnections() >= options_.maxConnections)) {
        Conn& oldest = *unopened_.begin()->second;
        log_ << "vx7sim: connection " << oldest.serial
             << " has not opened; closing it to make room for a new one" << std::endl;
        close(oldest, nullptr);
    }
}

void RelayServer::expireUnopened(Clock::time_point now) {
    while (!unopened_.empty() &&
           now - unopened_.begin()->second->accepted >= options_.openTimeout) {
        Conn& c = *unopened_.begin()->second;
        log_ << "vx7sim: connection " << c.serial << " did not open within "
             << options_.openTimeout.count() << " ms; closing it" << std::endl;
        close(c, nullptr);
    }
}

void RelayServer::readFrom(Conn& c) {
    for (int round = 0; round < 4; ++round) {
        const Conn::Read r = c.receive();
        if (r.ended) {
            close(c, r.why.empty() ? nullptr : r.why.c_str());
            return;
        }
        if (r.bytes == 0 || !processFrames(c)) {
            return;
        }
        if (!r.full) {
            return;
        }
    }
}

bool RelayServer::processFrames(Conn& c) {
    Conn::Frame f;
    for (;;) {
        const Conn::FrameStatus status = c.nextFrame(f);
        if (status == Conn::FrameStatus::Partial) {
            break;
        }
        if (status == Conn::FrameStatus::Oversized) {
            log_ << "vx7sim: connection " << c.serial << ": frame of type " << f.header.type
                 << " with parts of " << f.header.size << " and " << f.header.ex_size
                 << " bytes, over the limit; closing it" << std::endl;
            close(c, nullptr);
            return false;
        }
        if (!handleFrame(c, f.header.type, f.body, f.header.size, f.ex, f.header.ex_size) ||
            c.dead) {
            return false;
        }
    }
    c.compactInput();
    return true;
}

bool RelayServer::handleFrame(Conn& c, std::uint32_t type, const unsigned char* body,
                              std::uint32_t size, const unsigned char* ex, std::uint32_t exSize) {
    msg_t m;
    m.type = type;
    m.size = size;
    m.ex_size = exSize;
    m.body = const_cast<unsigned char*>(body);
    m.ex = const_cast<unsigned char*>(ex);
    switch (type) {
        case TKS_FRAME_OPEN: {
            TKSOpenRequest req;
            if (c.opened || !tksDecodeOpen(m, req)) {
                log_ << "vx7sim: connection " << c.serial
                     << (c.opened ? ": second open" : ": malformed open") << "; closing it"
                     << std::endl;
                close(c, nullptr);
                return false;
            }
            std::uint16_t inst = nextInstance();
            if (inst == 0) {
                log_ << "vx7sim: no address left for connection " << c.serial << std::endl;
                close(c, nullptr);
                return false;
            }
            c.addr = TKCompDesc{};
            c.addr.board = TK_HOST_BOARD;
            c.addr.instance = inst;
            c.opened = true;
            unopened_.erase(c.serial);
            byInstance_[inst] = &c;
            unsigned char assigned[TKS_ASSIGNED_BODY_BYTES];
            tksEncodeAssigned(c.addr, assigned);
            sendFrame(c, TKS_FRAME_ASSIGNED, assigned, sizeof assigned, nullptr, 0);
            return true;
        }
        case TKS_FRAME_MESSAGE: {
            if (!c.opened) {
                log_ << "vx7sim: connection " << c.serial << ": message before open; closing it"
                     << std::endl;
                close(c, nullptr);
                return false;
            }
            TKMsg32Bit* block = tksBlockFromFrame(m);
            if (!block) {
                log_ << "vx7sim: connection " << c.serial << ": malformed message frame (header of "
                     << size << " bytes, body of " << exSize << "); closing it" << std::endl;
                close(c, nullptr);
                return false;
            }
            // The relay knows who sent it; a client cannot speak for another address.
            block->srcBoard = c.addr.board;
            block->srcProcessor = c.addr.processor;
            block->srcComponent = c.addr.component;
            block->srcNode = c.addr.node;
            block->srcInstance = c.addr.instance;
            if (options_.trace) {
                log_ << "trace " << traceLine("in", c.serial, block) << std::endl;
            }
            route(block);
            return true;
        }
        case TKS_FRAME_CLOSE:
            // The client closes the socket once it has the acknowledgement; closing it first
            // from here would look to the client's reader like a broken connection.
            sendFrame(c, TKS_FRAME_CLOSE_ACK, nullptr, 0, nullptr, 0);
            if (c.opened) {
                emu_.forget(c.addr);
            }
            return true;
        default:
            log_ << "vx7sim: connection " << c.serial << ": unknown frame type " << type
                 << "; closing it" << std::endl;
            close(c, nullptr);
            return false;
    }
}

void RelayServer::route(TKMsg32Bit* block) {
    TKCompDesc tgt{};
    (void)tkMsgFieldGet(block, TK_FIELD_TGT, &tgt);
    if (isHostAddress(tgt)) {
        auto it = byInstance_.find(tgt.instance);
        if (it != byInstance_.end() && !it->second->dead && tgt.processor == 0 &&
            tgt.component == 0 && tgt.node == 0) {
            sendBlock(*it->second, block);
        } else {
            emu_.stats().undeliverable++;
        }
        tkMsgFree(block);
        return;
    }
    emu_.receive(block);
    drainEmulation();
}

void RelayServer::drainEmulation() {
    auto now = Clock::now();
    while (TKMsg32Bit* out = emu_.popDue(now)) {
        TKCompDesc tgt{};
        tgt.board = out->tgtBoard;
        tgt.instance = out->tgtInstance;
        auto it = byInstance_.find(tgt.instance);
        if (isHostAddress(tgt) && it != byInstance_.end() && !it->second->dead &&
            out->tgtProcessor == 0 && out->tgtComponent == 0 && out->tgtNode == 0) {
            sendBlock(*it->second, out);
        } else {
            emu_.stats().undeliverable++;
        }
        tkMsgFree(out);
    }
}

bool RelayServer::outputRoom() const {
    for (const auto& [fd, c] : conns_) {
        if (c->pending() >= kBurstWatermark) {
            return false;
        }
    }
    return true;
}

void RelayServer::pumpBursts() {
    while (emu_.burstsPending() && outputRoom()) {
        emu_.pumpBursts(kBurstSlice);
        drainEmulation();
        flushAll();
        if (emu_.nextDue()) {
            break;  // delayed: they leave when their time comes
        }
    }
}

void RelayServer::sendFrame(Conn& c, std::uint32_t type, const unsigned char* body,
                            std::uint32_t size, const unsigned char* ex, std::uint32_t exSize) {
    if (c.dead) {
        return;
    }
    queued_ += c.queueFrame(type, body, size, ex, exSize);
    checkPending(c);
}

void RelayServer::checkPending(Conn& c) {
    if (c.pending() > options_.maxPendingOutput) {
        log_ << "vx7sim: connection " << c.serial << " reads too slowly (" << c.pending()
             << " bytes waiting); closing it" << std::endl;
        close(c, nullptr);
    }
    enforceQueuedCap();
}

void RelayServer::enforceQueuedCap() {
    while (queued_ > options_.maxQueuedOutput) {
        Conn* worst = nullptr;
        for (auto& [fd, c] : conns_) {
            if (!c->dead && (!worst || c->pending() > worst->pending())) {
                worst = c.get();
            }
        }
        if (!worst) {
            return;
        }
        log_ << "vx7sim: " << queued_ << " bytes waiting for all clients, over the cap of "
             << options_.maxQueuedOutput << "; connection " << worst->serial
             << " has the most unread (" << worst->pending() << "); closing it" << std::endl;
        close(*worst, nullptr);
    }
}

void RelayServer::sendBlock(Conn& c, const TKMsg32Bit* block) {
    if (!tksFrameSizesValid(TKS_MSG_HEADER_BYTES, block->size)) {
        emu_.stats().undeliverable++;
        return;
    }
    if (options_.trace) {
        log_ << "trace " << traceLine("out", c.serial, block) << std::endl;
    }
    if (c.dead) {
        return;
    }
    queued_ += c.queueBlock(block);
    checkPending(c);
}

void RelayServer::flush(Conn& c) {
    if (c.dead) {
        return;
    }
    std::size_t sent = 0;
    std::string why;
    const bool ok = c.send(sent, why);
    queued_ -= sent;
    if (!ok) {
        close(c, why.c_str());
        return;
    }
    if (c.pending() > options_.maxPendingOutput) {
        log_ << "vx7sim: connection " << c.serial << " reads too slowly (" << c.pending()
             << " bytes waiting); closing it" << std::endl;
        close(c, nullptr);
        return;
    }
    bool want = c.pending() > 0;
    if (want != c.wantWrite) {
        c.wantWrite = want;
        epoll_event ev{};
        ev.events = EPOLLIN | (want ? EPOLLOUT : 0u);
        ev.data.fd = c.fd;
        epoll_ctl(epollFd_, EPOLL_CTL_MOD, c.fd, &ev);
    }
}

void RelayServer::flushAll() {
    for (auto& [fd, c] : conns_) {
        if (!c->dead && c->pending() > 0) {
            flush(*c);
        }
    }
}

void RelayServer::close(Conn& c, const char* why) {
    if (c.dead) {
        return;
    }
    if (why) {
        log_ << "vx7sim: connection " << c.serial << ": " << why << std::endl;
    }
    c.dead = true;
    epoll_ctl(epollFd_, EPOLL_CTL_DEL, c.fd, nullptr);
    unopened_.erase(c.serial);
    queued_ -= c.discardOutput();
    if (c.opened) {
        byInstance_.erase(c.addr.instance);
        emu_.forget(c.addr);
    }
    doomed_.push_back(c.fd);
}

void RelayServer::reap() {
    for (int fd : doomed_) {
        ::close(fd);
        conns_.erase(fd);
    }
    doomed_.clear();
    connectionCount_.store(conns_.size());
}

void RelayServer::dropAll() {
    for (auto& [fd, c] : conns_) {
        close(*c, nullptr);
    }
}

void RelayServer::stop() {
    stopRequested_.store(true);
    std::uint64_t one = 1;
    if (wakeFd_ >= 0) {
        [[maybe_unused]] ssize_t w = ::write(wakeFd_, &one, sizeof one);
    }
}

}  // namespace sim
