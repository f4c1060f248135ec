#include "framework/Marshal.h"

namespace tolk {

unsigned int putFirst(Msg* m, unsigned int off, unsigned int desc, const void* p) {
    tkMsgVarFieldPut(m->getMsgRef(), 1, &off, desc, p);
    if (off == 0) {
        off = wire::bytesOf(desc);
    }
    return off;
}

unsigned int getFirst(Msg* m, unsigned int off, unsigned int desc, void* p) {
    tkMsgVarFieldGet(m->getMsgRef(), 1, &off, desc, p);
    if (off == 0) {
        off = wire::bytesOf(desc);
    }
    return off;
}

unsigned int putField(Msg* m, unsigned int off, unsigned int desc, const void* p) {
    tkMsgVarFieldPut(m->getMsgRef(), 1, &off, desc, p);
    return off;
}

unsigned int getField(Msg* m, unsigned int off, unsigned int desc, void* p) {
    tkMsgVarFieldGet(m->getMsgRef(), 1, &off, desc, p);
    return off;
}

unsigned int remaining(Msg* m, unsigned int off) {
    unsigned int size = m->getSize();
    return size > off ? size - off : 0;
}

}  // namespace tolk
