// The small TCP socket wrapper under the remote transport, and its text helpers.
#pragma once

#include <netinet/in.h>

#include <atomic>
#include <chrono>
#include <cstddef>

#include "transport/TKSFrame.h"

class sock {
  public:
    // What the calls below return, unless they say otherwise.
    static constexpr int SOCK_OK = 0;
    static constexpr int SOCK_FAILED = -1;

    sock(const char* name, int port);
    sock(unsigned long address, int port);
    sock(int fd, sockaddr_in& peer);
    explicit sock(int fd);
    sock();
    ~sock();
    sock(const sock&) = delete;
    sock& operator=(const sock&) = delete;

    int connect();
    // As connect(), but gives up after timeoutMs; errno tells why it failed (ETIMEDOUT when the
    // time ran out).
    int connect(int timeoutMs);
    int close();
    int shutdown(int how);

    int bind();
    int listen(int backlog);
    sock* accept();
    sock* accept(sockaddr_in& peer);

    // mode 'r', 'w' or 'e'; -1 and -1 mean no time limit.
    bool ready(char mode, long seconds, long microseconds);
    bool ready(long seconds, long microseconds) { return ready('r', seconds, microseconds); }

    // 0 when all bytes moved; a negative result on error; the bytes still missing when the peer
    // closed. Either failure sets `failed`.
    long readblock(void* dst, long n);
    long writeblock(const void* src, long n);
    // As readblock, but gives up at `deadline` with SOCK_TIMED_OUT. `*missing`, when given, is
    // what did not come.
    static constexpr long SOCK_TIMED_OUT = -2;
    long readblock(void* dst, long n, std::chrono::steady_clock::time_point deadline,
                   long* missing = nullptr);

    int snd_msg(const msg_t& m);
    int get_msg(msg_t& m);

    // Makes a blocked readblock return a failure from now on (used at shutdown).
    void interrupt();

    int getFd() const { return fd; }
    bool isFailed() const { return failed.load() != 0; }
    int getPort() const { return ntohs(peer.sin_port); }
    const sockaddr_in& getPeer() const { return peer; }
    // The port this socket is bound to (a server bound to port 0 learns its port here).
    int localPort() const;

  private:
    friend class SockByteSource;

    void makeSocket(unsigned long address, int port);
    // The loop of both readblocks; no deadline when `limited` is false.
    long readUntil(void* dst, long n, bool limited, std::chrono::steady_clock::time_point deadline,
                   long* missing);

    int fd = -1;
    std::atomic<int> failed{0};
    std::atomic<bool> interrupted{false};
    sockaddr_in peer{};
    // Received bytes not yet handed out: fewer system calls per frame.
    unsigned char inBuf[16384];
    std::size_t inPos = 0;
    std::size_t inLen = 0;
};

bool is_dn(const char* text);
void dntoip(char* dst, const char* name);  // dst needs 16 bytes
int stn(const char* text);
void print_msg(const char* title, const msg_t& m);
void byte_print_msg(const char* bytes, int n);
