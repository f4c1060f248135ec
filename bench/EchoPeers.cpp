#include "EchoPeers.h"

#include <memory>
#include <vector>

#include "transport/TKSFrame.h"

namespace lp_bench {

void turnAround(TKMsg32Bit* block, unsigned int completionType) {
    TKCompDesc from{}, to{};
    tkMsgFieldGet(block, TK_FIELD_SRC, &from);
    tkMsgFieldGet(block, TK_FIELD_TGT, &to);
    tkMsgFieldPut(block, TK_FIELD_SRC, &to);
    tkMsgFieldPut(block, TK_FIELD_TGT, &from);
    block->type = completionType;
}

void serveEchoQueue(TKQueueHandle queue, unsigned int completionType) {
    TKMsg32Bit* in = nullptr;
    while (tkMsgRead(queue, 0, &in) == TK_OK) {
        turnAround(in, completionType);
        tkMsgWrite(queue, in, 0);
    }
}

void serveEchoRelay(sock& listener, unsigned int completionType) {
    std::unique_ptr<sock> conn(listener.accept());
    if (!conn) {
        return;
    }
    msg_t open;
    if (conn->get_msg(open) != 0) {
        return;
    }
    free_msg(open);
    TKCompDesc assigned{};
    assigned.board = 0xFE;
    assigned.instance = 1;
    unsigned char body[TKS_ASSIGNED_BODY_BYTES];
    tksEncodeAssigned(assigned, body);
    msg_t a;
    a.type = TKS_FRAME_ASSIGNED;
    a.size = TKS_ASSIGNED_BODY_BYTES;
    a.body = body;
    conn->snd_msg(a);
    std::vector<unsigned char> out;
    for (;;) {
        msg_t m;
        if (conn->get_msg(m) != 0) {
            return;
        }
        if (m.type == TKS_FRAME_CLOSE) {
            free_msg(m);
            msg_t ack;
            ack.type = TKS_FRAME_CLOSE_ACK;
            conn->snd_msg(ack);
            return;
        }
        TKMsg32Bit* b = tksBlockFromFrame(m);
        free_msg(m);
        if (b == nullptr) {
            continue;
        }
        turnAround(b, completionType);
        tksEncodeMessageFrame(b, out);
        tkMsgFree(b);
        conn->writeblock(out.data(), static_cast<long>(out.size()));
    }
}

}  // namespace lp_bench
