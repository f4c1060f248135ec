#include "framework/CompDesc_t.h"

#include "framework/Marshal.h"

namespace tolk {

namespace {
constexpr unsigned int U16 = wire::pack(wire::U16);
constexpr unsigned int U8 = wire::pack(wire::U8);
}  // namespace

CompDesc_t::CompDesc_t(const TKCompDesc& d)
    : instance(d.instance),
      board(d.board),
      processor(d.processor),
      component(d.component),
      node(d.node) {}

CompDesc_t::CompDesc_t(unsigned short instance, unsigned char board, unsigned char processor,
                       unsigned char component, unsigned char node)
    : instance(instance), board(board), processor(processor), component(component), node(node) {}

CompDesc_t& CompDesc_t::operator=(const CompDesc_t& other) {
    instance = other.instance;
    board = other.board;
    processor = other.processor;
    component = other.component;
    node = other.node;
    return *this;
}

bool CompDesc_t::operator==(const CompDesc_t& other) const {
    return instance == other.instance && board == other.board && processor == other.processor &&
           component == other.component && node == other.node;
}

TKCompDesc CompDesc_t::getTKCompDesc() const {
    TKCompDesc d{};
    d.instance = instance;
    d.board = board;
    d.processor = processor;
    d.component = component;
    d.node = node;
    return d;
}

void CompDesc_t::toStream(std::ostream* os) const {
    *os << "{Node " << static_cast<unsigned int>(node) << " Board "
        << static_cast<unsigned int>(board) << " Processor " << static_cast<unsigned int>(processor)
        << " Component " << static_cast<unsigned int>(component) << " Instance " << instance << "}";
}

unsigned int CompDesc_t::writeMsg(Msg* msg, unsigned int offset) {
    offset = putFirst(msg, offset, U16, &instance);
    return putGroup(msg, offset, U8, &board, U8, &processor, U8, &component, U8, &node);
}

unsigned int CompDesc_t::readMsg(Msg* msg, unsigned int offset) {
    offset = getFirst(msg, offset, U16, &instance);
    return getGroup(msg, offset, U8, &board, U8, &processor, U8, &component, U8, &node);
}

}  // namespace tolk

std::ostream& operator<<(std::ostream& os, const TKCompDesc& d) {
    tolk::StreamFlagsGuard g(os);
    os << std::hex << std::showbase << static_cast<unsigned int>(d.node) << ":"
       << static_cast<unsigned int>(d.board) << ":" << static_cast<unsigned int>(d.processor) << ":"
       << static_cast<unsigned int>(d.component) << ":" << d.instance;
    return os;
}
