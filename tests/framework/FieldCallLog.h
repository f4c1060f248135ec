#pragma once

// Records every body field call the framework makes (the test executable wraps the library's
// two variable field calls), so that tests can check chunking and call counts, not just bytes.

#include <vector>

struct FieldCall {
    bool put;
    unsigned int offsetIn;
    std::vector<unsigned int> descs;
    bool operator==(const FieldCall&) const = default;
};

std::vector<FieldCall>& fieldCalls();
