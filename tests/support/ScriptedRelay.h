// A relay peer for tests: listens on loopback, accepts one connection and plays a script on it.
#pragma once

#include <arpa/inet.h>
#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <string>
#include <thread>

#include "Golden.h"
#include "transport/TKSFrame.h"
#include "transport/TKSSock.h"

using golden::Bytes;

// A frame header as a relay writes it: type, 0, size, extra size, and the sender's own pointer
// (which a reader ignores).
inline Bytes frameHeader(std::uint32_t type, std::uint32_t size, std::uint32_t exSize) {
    return golden::words({type, 0, size, exSize, 0xDEADBEEF});
}

class ScriptedRelay {
  public:
    using Script = std::function<void(sock& conn)>;

    // Plays one script on each of `connections` connections, one after the other: the index
    // tells which connection it is.
    using Scripts = std::function<void(sock& conn, int index)>;

    explicit ScriptedRelay(Script script)
        : ScriptedRelay([script](sock& conn, int) { script(conn); }, 1) {}
    ScriptedRelay(Scripts scripts, int connections)
        : listener(std::make_unique<sock>(inet_addr("127.0.0.1"), 0)) {
        EXPECT_EQ(0, listener->bind());
        EXPECT_EQ(0, listener->listen(4));
        port = listener->localPort();
        worker = std::thread([this, scripts, connections] {
            for (int i = 0; i < connections; ++i) {
                std::unique_ptr<sock> conn(listener->accept());
                if (conn) {
                    scripts(*conn, i);
                }
            }
        });
    }
    ~ScriptedRelay() { join(); }
    void join() {
        if (worker.joinable()) {
            worker.join();
        }
    }
    std::string address() const { return "127.0.0.1:" + std::to_string(port); }

    static TKCompDesc assignedAddress() {
        TKCompDesc d{};
        d.node = 2;
        d.board = 0xFE;
        d.processor = 0;
        d.component = 0;
        d.instance = 0x4321;
        return d;
    }

    // Reads the open and answers with the assigned address.
    static bool acceptOpen(sock& conn, Bytes* openBody = nullptr,
                           TKCompDesc assigned = assignedAddress()) {
        msg_t m;
        if (conn.get_msg(m) != 0 || m.type != TKS_FRAME_OPEN) {
            free_msg(m);
            return false;
        }
        if (openBody != nullptr) {
            *openBody = Bytes(m.body, m.body + m.size);
        }
        free_msg(m);
        unsigned char body[TKS_ASSIGNED_BODY_BYTES];
        tksEncodeAssigned(assigned, body);
        msg_t a;
        a.type = TKS_FRAME_ASSIGNED;
        a.size = TKS_ASSIGNED_BODY_BYTES;
        a.body = body;
        return conn.snd_msg(a) == 0;
    }

    static void sendEmpty(sock& conn, std::uint32_t type) {
        msg_t m;
        m.type = type;
        conn.snd_msg(m);
    }

    static void sendRaw(sock& conn, const Bytes& bytes) {
        conn.writeblock(bytes.data(), static_cast<long>(bytes.size()));
    }

    // Answers every message with `answer`, acknowledges the close, and returns.
    static void serve(sock& conn, const std::function<void(sock&, TKMsg32Bit*)>& answer) {
        for (;;) {
            msg_t m;
            if (conn.get_msg(m) != 0) {
                return;
            }
            if (m.type == TKS_FRAME_CLOSE) {
                free_msg(m);
                sendEmpty(conn, TKS_FRAME_CLOSE_ACK);
                return;
            }
            TKMsg32Bit* b = tksBlockFromFrame(m);
            free_msg(m);
            if (b != nullptr) {
                answer(conn, b);
            }
        }
    }

    static void sendBlock(sock& conn, TKMsg32Bit* b) {
        Bytes out;
        tksEncodeMessageFrame(b, out);
        sendRaw(conn, out);
        tkMsgFree(b);
    }

  private:
    std::unique_ptr<sock> listener;
    int port = 0;
    std::thread worker;
};
