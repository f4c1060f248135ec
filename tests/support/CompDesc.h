#pragma once

#include <cstdint>

#include "platform/tkhost/tkhost.h"

// A component address, field by field, in the order a test reads them.
inline TKCompDesc compDesc(std::uint16_t instance, std::uint8_t board, std::uint8_t processor = 0,
                           std::uint8_t component = 0, std::uint8_t node = 0) {
    TKCompDesc d{};
    d.instance = instance;
    d.board = board;
    d.processor = processor;
    d.component = component;
    d.node = node;
    return d;
}
