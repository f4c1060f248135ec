#include "transport/TKSSock.h"

#include <arpa/inet.h>
#include <fcntl.h>
#include <netdb.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iostream>
#include <string>
#include <vector>

#include "transport/TKSWholeLine.h"

class SockByteSource : public TKSByteSource {
  public:
    explicit SockByteSource(sock& s) : s(s) {}
    int readExact(void* dst, std::size_t n) override {
        return s.readblock(dst, static_cast<long>(n)) == 0 && !s.isFailed() ? 0 : -1;
    }

  private:
    sock& s;
};

bool is_dn(const char* text) {
    for (const char* p = text; *p != '\0'; ++p) {
        if (static_cast<unsigned char>(*p) >= ':') {
            return true;
        }
    }
    return false;
}

void dntoip(char* dst, const char* name) {
    dst[0] = '\0';
    addrinfo hints{};
    hints.ai_family = AF_INET;
    hints.ai_socktype = SOCK_STREAM;
    addrinfo* res = nullptr;
    if (getaddrinfo(name, nullptr, &hints, &res) != 0 || res == nullptr) {
        return;
    }
    const auto* in = reinterpret_cast<const sockaddr_in*>(res->ai_addr);
    const auto* b = reinterpret_cast<const unsigned char*>(&in->sin_addr.s_addr);
    std::snprintf(dst, 16, "%u.%u.%u.%u", b[0], b[1], b[2], b[3]);
    freeaddrinfo(res);
}

int stn(const char* text) {
    if (std::strchr(text, 'x') != nullptr || std::strchr(text, 'X') != nullptr) {
        bool negative = text[0] == '-';
        const char* digits = negative ? text + 1 : text;
        unsigned int v = 0;
        if (std::sscanf(digits, "0x%x", &v) != 1 && std::sscanf(digits, "0X%x", &v) != 1) {
            v = 0;
        }
        return negative ? -static_cast<int>(v) : static_cast<int>(v);
    }
    return std::atoi(text);
}

void print_msg(const char* title, const msg_t& m) {
    std::cout << "----------------" << std::endl;
    std::cout << "** " << title << " **" << std::endl;
    std::cout << "   type = " << m.type << std::endl;
    std::cout << "   tran = " << m.tran << std::endl;
    std::cout << "   size = " << m.size << std::endl;
    std::cout << "ex_size = " << m.ex_size << std::endl;
    std::cout << "----------------" << std::endl;
}

void byte_print_msg(const char* bytes, int n) {
    for (int i = 0; i < n; ++i) {
        std::printf("0x%x ", static_cast<unsigned char>(bytes[i]));
    }
    std::printf("\n");
}

sock::sock() = default;

sock::sock(int fd) : fd(fd) {}

sock::sock(int fd, sockaddr_in& addr) : fd(fd), peer(addr) {}

sock::sock(unsigned long address, int port) {
    makeSocket(address, port);
}

sock::sock(const char* name, int port) {
    std::string copy = name != nullptr ? name : "";
    // The name ends at the first ':'; every ':' starts a port and the last one counts.
    std::size_t first = copy.find(':');
    std::size_t at = first;
    while (at != std::string::npos) {
        std::size_t next = copy.find(':', at + 1);
        port =
            stn(copy.substr(at + 1, next == std::string::npos ? std::string::npos : next - at - 1)
                    .c_str());
        at = next;
    }
    std::string host = copy.substr(0, first);
    // Known before the name is resolved, so that a failure can name the port it was for.
    peer.sin_port = htons(static_cast<std::uint16_t>(port));
    char dotted[16] = {0};
    if (is_dn(host.c_str())) {
        dntoip(dotted, host.c_str());
        if (dotted[0] == '\0') {
            failed = 1;
            return;
        }
    } else {
        std::snprintf(dotted, sizeof dotted, "%s", host.c_str());
    }
    in_addr_t addr = inet_addr(dotted);
    if (addr == INADDR_NONE) {
        failed = 1;
        return;
    }
    makeSocket(addr, port);
}

void sock::makeSocket(unsigned long address, int port) {
    fd = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (fd < 0) {
        failed = 1;
        fd = -1;
        return;
    }
    peer.sin_family = AF_INET;
    peer.sin_addr.s_addr = static_cast<in_addr_t>(address);
    peer.sin_port = htons(static_cast<std::uint16_t>(port));
}

sock::~sock() {
    if (fd <= 0) {
        return;
    }
    if (failed.load() != 0) {
        ::close(fd);
    } else {
        close();
    }
}

int sock::connect() {
    if (fd < 0 || failed.load() != 0) {
        failed = 1;
        return SOCK_FAILED;
    }
    int r;
    do {
        r = ::connect(fd, reinterpret_cast<sockaddr*>(&peer), sizeof peer);
    } while (r < 0 && errno == EINTR);
    if (r < 0) {
        failed = 1;
        return SOCK_FAILED;
    }
    // Requests and replies are small and wait on each other: never hold one back.
    int one = 1;
    setsockopt(fd, IPPROTO_TCP, TCP_NODELAY, &one, sizeof one);
    return SOCK_OK;
}

int sock::connect(int timeoutMs) {
    if (fd < 0 || failed.load() != 0) {
        failed = 1;
        errno = EBADF;
        return SOCK_FAILED;
    }
    int flags = fcntl(fd, F_GETFL, 0);
    if (flags < 0 || fcntl(fd, F_SETFL, flags | O_NONBLOCK) < 0) {
        failed = 1;
        return SOCK_FAILED;
    }
    int r = ::connect(fd, reinterpret_cast<sockaddr*>(&peer), sizeof peer);
    int error = r == 0 ? 0 : errno;
    if (r < 0 && (errno == EINPROGRESS || errno == EINTR)) {
        auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(timeoutMs);
        error = ETIMEDOUT;
        for (;;) {
            auto left = std::chrono::duration_cast<std::chrono::milliseconds>(
                            deadline - std::chrono::steady_clock::now())
                            .count();
            if (left <= 0 || interrupted.load()) {
                break;
            }
            pollfd p{};
            p.fd = fd;
            p.events = POLLOUT;
            int ready = ::poll(&p, 1, static_cast<int>(left));
            if (ready < 0 && errno == EINTR) {
                continue;
            }
            if (ready > 0) {
                socklen_t len = sizeof error;
                if (getsockopt(fd, SOL_SOCKET, SO_ERROR, &error, &len) != 0) {
                    error = errno;
                }
            }
            if (ready != 0) {
                break;
            }
        }
        if (interrupted.load() && error == ETIMEDOUT) {
            error = EINTR;
        }
    }
    fcntl(fd, F_SETFL, flags);
    if (error != 0) {
        failed = 1;
        errno = error;
        return SOCK_FAILED;
    }
    int one = 1;
    setsockopt(fd, IPPROTO_TCP, TCP_NODELAY, &one, sizeof one);
    return SOCK_OK;
}

int sock::close() {
    if (fd < 0) {
        return SOCK_OK;
    }
    linger l{};
    l.l_onoff = 1;
    l.l_linger = 0;
    if (setsockopt(fd, SOL_SOCKET, SO_LINGER, &l, sizeof l) != 0) {
        TKSWholeLine() << "Unable to flush socket data, socket may remain open on " << fd
                       << std::endl;
    }
    int r = ::close(fd);
    fd = -1;
    return r;
}

int sock::shutdown(int how) {
    int r = ::shutdown(fd, how);
    if (r < 0) {
        failed = 1;
    }
    return r;
}

int sock::bind() {
    int one = 1;
    setsockopt(fd, SOL_SOCKET, SO_REUSEADDR, &one, sizeof one);
    int r = ::bind(fd, reinterpret_cast<sockaddr*>(&peer), sizeof peer);
    if (r < 0) {
        failed = 1;
    }
    return r;
}

int sock::listen(int backlog) {
    int r = ::listen(fd, backlog);
    if (r < 0) {
        failed = 1;
    }
    return r;
}

sock* sock::accept() {
    sockaddr_in addr{};
    return accept(addr);
}

sock* sock::accept(sockaddr_in& addr) {
    socklen_t len = sizeof addr;
    int c;
    do {
        c = ::accept4(fd, reinterpret_cast<sockaddr*>(&addr), &len, SOCK_CLOEXEC);
    } while (c < 0 && errno == EINTR);
    if (c < 0) {
        failed = 1;
        return nullptr;
    }
    int one = 1;
    setsockopt(c, IPPROTO_TCP, TCP_NODELAY, &one, sizeof one);
    return new sock(c, addr);
}

int sock::localPort() const {
    sockaddr_in addr{};
    socklen_t len = sizeof addr;
    if (getsockname(fd, reinterpret_cast<sockaddr*>(&addr), &len) != 0) {
        return -1;
    }
    return ntohs(addr.sin_port);
}

bool sock::ready(char mode, long seconds, long microseconds) {
    pollfd p{};
    p.fd = fd;
    p.events = mode == 'r' ? POLLIN : mode == 'w' ? POLLOUT : POLLPRI;
    int timeout = -1;
    if (seconds != -1 || microseconds != -1) {
        timeout = static_cast<int>((seconds < 0 ? 0 : seconds) * 1000 +
                                   (microseconds < 0 ? 0 : microseconds) / 1000);
    }
    int r;
    do {
        r = ::poll(&p, 1, timeout);
    } while (r < 0 && errno == EINTR);
    if (r < 0) {
        failed = 1;
        return false;
    }
    // A hang-up or error counts as ready: the next call reports what happened.
    return r > 0;
}

long sock::readblock(void* dst, long n) {
    return readUntil(dst, n, false, {}, nullptr);
}

long sock::readblock(void* dst, long n, std::chrono::steady_clock::time_point deadline,
                     long* missing) {
    return readUntil(dst, n, true, deadline, missing);
}

long sock::readUntil(void* dst, long n, bool limited,
                     std::chrono::steady_clock::time_point deadline, long* missingOut) {
    if (missingOut != nullptr) {
        *missingOut = n < 0 ? 0 : n;
    }
    if (n < 1) {
        return n;
    }
    auto* out = static_cast<unsigned char*>(dst);
    long missing = n;
    while (missing > 0) {
        if (missingOut != nullptr) {
            *missingOut = missing;
        }
        if (inPos < inLen) {
            std::size_t take = inLen - inPos;
            if (take > static_cast<std::size_t>(missing)) {
                take = static_cast<std::size_t>(missing);
            }
            std::memcpy(out, inBuf + inPos, take);
            inPos += take;
            out += take;
            missing -= static_cast<long>(take);
            continue;
        }
        if (interrupted.load()) {
            failed = 1;
            return SOCK_FAILED;
        }
        if (limited) {
            auto left = std::chrono::duration_cast<std::chrono::microseconds>(
                            deadline - std::chrono::steady_clock::now())
                            .count();
            // Rounded up, so that a wait never ends a little before its deadline.
            if (left <= 0 || !ready('r', 0, left + 999)) {
                if (std::chrono::steady_clock::now() >= deadline) {
                    failed = 1;
                    return SOCK_TIMED_OUT;
                }
                continue;
            }
        } else {
            ready('r', -1, -1);
        }
        ssize_t r = ::recv(fd, inBuf, sizeof inBuf, 0);
        if (r < 0) {
            if (errno == EINTR) {
                continue;
            }
            failed = 1;
            return SOCK_FAILED;
        }
        if (r == 0) {
            failed = 1;
            return missing;
        }
        inPos = 0;
        inLen = static_cast<std::size_t>(r);
    }
    if (missingOut != nullptr) {
        *missingOut = 0;
    }
    return SOCK_OK;
}

long sock::writeblock(const void* src, long n) {
    if (n < 1) {
        return n;
    }
    auto* in = static_cast<const unsigned char*>(src);
    long missing = n;
    while (missing > 0) {
        ssize_t r = ::send(fd, in, static_cast<std::size_t>(missing), MSG_NOSIGNAL);
        if (r < 0) {
            if (errno == EINTR) {
                continue;
            }
            if (errno == EAGAIN || errno == EWOULDBLOCK) {
                ready('w', -1, -1);
                continue;
            }
            failed = 1;
            return SOCK_FAILED;
        }
        if (r == 0) {
            failed = 1;
            return missing;
        }
        in += r;
        missing -= static_cast<long>(r);
    }
    return SOCK_OK;
}

int sock::snd_msg(const msg_t& m) {
    std::vector<unsigned char> bytes = tksEncodeFrame(m);
    if (bytes.empty()) {
        return SOCK_FAILED;
    }
    long r = writeblock(bytes.data(), static_cast<long>(bytes.size()));
    if (r < 0) {
        return static_cast<int>(r);
    }
    return failed.load() != 0 || r != 0 ? SOCK_FAILED : SOCK_OK;
}

int sock::get_msg(msg_t& m) {
    SockByteSource src(*this);
    switch (tksReadFrame(src, m)) {
        case TKS_READ_OK:
            return SOCK_OK;
        case TKS_READ_NO_MEMORY:
            TKSWholeLine() << "Unable to allocate memory in get_msg" << std::endl;
            return SOCK_FAILED;
        default:
            return SOCK_FAILED;
    }
}

void sock::interrupt() {
    interrupted = true;
    if (fd >= 0) {
        ::shutdown(fd, SHUT_RDWR);
    }
}
