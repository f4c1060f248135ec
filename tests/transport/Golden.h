#pragma once

#include <gtest/gtest.h>

#include <cstdio>
#include <string>
#include <vector>

using Bytes = std::vector<unsigned char>;

inline std::string Hex(const unsigned char* p, std::size_t n) {
    std::string s;
    char buf[4];
    for (std::size_t i = 0; i < n; ++i) {
        std::snprintf(buf, sizeof buf, "%02X ", p[i]);
        s += buf;
    }
    return s;
}

inline void ExpectBytes(const Bytes& actual, const Bytes& golden) {
    std::size_t n = actual.size() < golden.size() ? actual.size() : golden.size();
    for (std::size_t i = 0; i < n; ++i) {
        if (actual[i] != golden[i]) {
            ADD_FAILURE() << "first difference at offset " << i
                          << "\n  actual: " << Hex(actual.data(), actual.size())
                          << "\n  golden: " << Hex(golden.data(), golden.size());
            return;
        }
    }
    EXPECT_EQ(golden.size(), actual.size()) << "actual: " << Hex(actual.data(), actual.size());
}

inline void PutU32(Bytes& b, unsigned int v) {
    b.push_back(static_cast<unsigned char>(v >> 24));
    b.push_back(static_cast<unsigned char>(v >> 16));
    b.push_back(static_cast<unsigned char>(v >> 8));
    b.push_back(static_cast<unsigned char>(v));
}
