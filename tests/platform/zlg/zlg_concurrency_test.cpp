#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

#include "TraceFile.h"
#include "platform/zlg/zlg.h"

namespace {

TEST(ZlgConcurrency, LinesFromManyThreadsNeverInterleave) {
    TraceFile trace("zlg_threads");
    constexpr int kThreads = 4;
    constexpr int kLines = 200;
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([t] {
            ZLG_HANDLE module = 0, label = 0;
            // Appended rather than "M" + std::to_string(t): GCC 12 at -O3 warns of an
            // overlapping memcpy inside the string insert that operator+ uses (-Wrestrict, a
            // false positive of that release).
            std::string name = "M";
            name += std::to_string(t);
            ZlgGetModuleHandle(name.c_str(), &module);
            ZlgGetLabelHandle("Error", &label);
            const std::string text(300, static_cast<char>('a' + t));
            for (int i = 0; i < kLines; ++i) {
                EXPECT_EQ(ZlgTraceNoClient(module, label, text.c_str()), ZLG_SUCCESS);
            }
        });
    }
    for (auto& t : threads) {
        t.join();
    }
    auto lines = trace.lines();
    ASSERT_EQ(lines.size(), static_cast<std::size_t>(kThreads * kLines));
    for (const auto& line : lines) {
        auto colon = line.find("/Error: ");
        ASSERT_NE(colon, std::string::npos) << line;
        const char who = line[colon - 1];  // the thread's module, M0..M3
        const std::string text = line.substr(colon + 8);
        EXPECT_EQ(text, std::string(300, static_cast<char>('a' + (who - '0')))) << line;
    }
}

}  // namespace
