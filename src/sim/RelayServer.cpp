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

struct RelayServer::Conn {
    int fd = -1;
    std::uint64_t serial = 0;
    bool opened = false;
    bool dead = false;
    bool wantWrite = false;
    Clock::time_point accepted;
    TKCompDesc addr{};
    std::vector<unsigned char> in;
    std::size_t inPos = 0;
    std::vector<unsigned char> out;
    std::size_t outPos = 0;

    std::size_t pending() const { return out.size() - outPos; }
};

namespace {

constexpr std::size_t kReadChunk = 256 * 1024;
constexpr std::size_t kMaxControlLine = 64 * 1024;
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
        auto c = std::make_unique<Conn>();
        c->fd = fd;
        c->serial = ++serial_;
        c->accepted = Clock::now();
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
    static thread_local std::vector<unsigned char> chunk(kReadChunk);
    for (int round = 0; round < 4; ++round) {
        ssize_t n = ::recv(c.fd, chunk.data(), chunk.size(), 0);
        if (n <= 0) {
            if (n == 0) {
                close(c, c.inPos < c.in.size() ? "closed in the middle of a frame" : nullptr);
                return;
            }
            if (errno == EAGAIN || errno == EWOULDBLOCK || errno == EINTR) {
                break;
            }
            close(c, std::strerror(errno));
            return;
        }
        c.in.insert(c.in.end(), chunk.data(), chunk.data() + n);
        if (!processFrames(c)) {
            return;
        }
        if (static_cast<std::size_t>(n) < chunk.size()) {
            break;
        }
    }
}

bool RelayServer::processFrames(Conn& c) {
    for (;;) {
        std::size_t avail = c.in.size() - c.inPos;
        if (avail < TKS_FRAME_HEADER_SIZE) {
            break;
        }
        const unsigned char* p = c.in.data() + c.inPos;
        msg_t h;
        tksDecodeFrameHeader(p, h);
        if (!tksFrameSizesValid(h.size, h.ex_size)) {
            log_ << "vx7sim: connection " << c.serial << ": frame of type " << h.type
                 << " with parts of " << h.size << " and " << h.ex_size
                 << " bytes, over the limit; closing it" << std::endl;
            close(c, nullptr);
            return false;
        }
        std::size_t whole = TKS_FRAME_HEADER_SIZE + h.size + h.ex_size;
        if (avail < whole) {
            break;
        }
        c.inPos += whole;
        const unsigned char* body = p + TKS_FRAME_HEADER_SIZE;
        if (!handleFrame(c, h.type, body, h.size, body + h.size, h.ex_size)) {
            return false;
        }
        if (c.dead) {
            return false;
        }
    }
    // Keep the buffer small: move what is left of a partial frame to the front.
    if (c.inPos > 0) {
        c.in.erase(c.in.begin(), c.in.begin() + static_cast<std::ptrdiff_t>(c.inPos));
        c.inPos = 0;
    }
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
    msg_t m;
    m.type = type;
    m.size = size;
    m.ex_size = exSize;
    unsigned char header[TKS_FRAME_HEADER_SIZE];
    tksEncodeFrameHeader(m, header);
    c.out.insert(c.out.end(), header, header + sizeof header);
    if (size) {
        c.out.insert(c.out.end(), body, body + size);
    }
    if (exSize) {
        c.out.insert(c.out.end(), ex, ex + exSize);
    }
    queued_ += sizeof header + size + exSize;
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
    unsigned char header[TKS_MSG_HEADER_BYTES];
    tksPackMsgHeader(block, header);
    sendFrame(c, TKS_FRAME_MESSAGE, header, sizeof header,
              reinterpret_cast<const unsigned char*>(block) + TK_MSG_HEADER_SIZE, block->size);
}

void RelayServer::flush(Conn& c) {
    while (!c.dead && c.pending() > 0) {
        ssize_t n = ::send(c.fd, c.out.data() + c.outPos, c.pending(), MSG_NOSIGNAL);
        if (n < 0) {
            if (errno == EINTR) {
                continue;
            }
            if (errno == EAGAIN || errno == EWOULDBLOCK) {
                break;
            }
            close(c, std::strerror(errno));
            return;
        }
        c.outPos += static_cast<std::size_t>(n);
        queued_ -= static_cast<std::size_t>(n);
    }
    if (c.dead) {
        return;
    }
    if (c.pending() == 0) {
        c.out.clear();
        c.outPos = 0;
    } else if (c.outPos > (1u << 20)) {
        c.out.erase(c.out.begin(), c.out.begin() + static_cast<std::ptrdiff_t>(c.outPos));
        c.outPos = 0;
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
    queued_ -= c.pending();
    c.out.clear();
    c.outPos = 0;
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

void RelayServer::readControl(int fd, std::ostream* out) {
    char buf[4096];
    for (;;) {
        ssize_t n = ::read(fd, buf, sizeof buf);
        if (n <= 0) {
            break;
        }
        std::string_view chunk(buf, static_cast<std::size_t>(n));
        while (!chunk.empty()) {
            std::size_t nl = chunk.find('\n');
            if (discardingControl_) {
                // The rest of a refused line is not a command of its own.
                if (nl == std::string_view::npos) {
                    break;
                }
                discardingControl_ = false;
                chunk.remove_prefix(nl + 1);
                continue;
            }
            controlPending_.append(chunk.substr(0, nl));
            if (controlPending_.size() > kMaxControlLine) {
                controlPending_.clear();
                discardingControl_ = nl == std::string_view::npos;
                if (out) {
                    *out << "error: control line too long" << std::endl;
                }
            } else if (nl != std::string_view::npos) {
                std::string reply = runControl(controlPending_);
                controlPending_.clear();
                if (!reply.empty() && out) {
                    *out << reply << std::endl;
                }
            }
            if (nl == std::string_view::npos) {
                break;
            }
            chunk.remove_prefix(nl + 1);
        }
    }
}

std::string RelayServer::runControl(const std::string& line) {
    ControlOutcome o = emu_.control(line);
    if (o.drop) {
        std::size_t n = liveConnections();
        dropAll();
        reap();
        o.reply = "ok dropped " + std::to_string(n);
    }
    if (o.quit) {
        running_ = false;
    }
    if (o.reply.rfind("ok stats", 0) == 0) {
        o.reply += " connections=" + std::to_string(liveConnections()) +
                   " queued=" + std::to_string(queued_);
    }
    drainEmulation();
    return o.reply;
}

std::string RelayServer::control(const std::string& line) {
    std::future<std::string> f;
    {
        std::lock_guard<std::mutex> g(crossLock_);
        cross_.push_back(CrossCall{line, {}});
        f = cross_.back().result.get_future();
    }
    std::uint64_t one = 1;
    [[maybe_unused]] ssize_t w = ::write(wakeFd_, &one, sizeof one);
    return f.get();
}

void RelayServer::playScript(Clock::time_point now) {
    while (running_ && scriptNext_ < script_.size() && scriptDue_ <= now) {
        const ScriptStep& step = script_[scriptNext_++];
        if (step.command.empty()) {
            scriptDue_ = now + std::chrono::milliseconds(step.sleepMs);
            continue;
        }
        log_ << "vx7sim: script line " << step.line << ": " << step.command << ": "
             << runControl(step.command) << std::endl;
    }
}

void RelayServer::runCrossThread() {
    std::deque<CrossCall> calls;
    {
        std::lock_guard<std::mutex> g(crossLock_);
        calls.swap(cross_);
    }
    for (CrossCall& call : calls) {
        call.result.set_value(runControl(call.line));
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
