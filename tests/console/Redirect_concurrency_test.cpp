#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <map>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "RedirectFixture.h"
#include "console/Redirect.h"

namespace lineprobe {
namespace {

constexpr int kWriters = 6;
constexpr int kLinesEach = 4000;

class RedirectedLogs : public testing::RedirectedStreams {
  protected:
    // "TAG writer W line I xx...x end", whole, or nothing: W and I go to `writer` and `index`.
    static bool ParseLine(const std::string& line, const std::string& tag, int& writer,
                          int& index) {
        const std::string head = tag + " writer ";
        if (line.rfind(head, 0) != 0) {
            return false;
        }
        int used = 0;
        if (std::sscanf(line.c_str() + head.size(), "%5d line %5d %n", &writer, &index, &used) !=
                2 ||
            used == 0) {
            return false;
        }
        const std::string tail = line.substr(head.size() + static_cast<std::size_t>(used));
        const std::size_t xs = tail.find_first_not_of('x');
        return xs != 0 && xs != std::string::npos && tail.substr(xs) == " end";
    }

    // Every line of the file must be one that a writer wrote, whole, and each exactly once.
    static void ExpectEveryLineOnce(const std::filesystem::path& log, const std::string& tag) {
        std::map<std::pair<int, int>, int> seen;
        std::ifstream file(log);
        std::string line;
        int broken = 0;
        while (std::getline(file, line)) {
            int writer = -1;
            int index = -1;
            if (!ParseLine(line, tag, writer, index)) {
                if (++broken <= 3) {
                    ADD_FAILURE() << log.filename() << ": torn line \"" << line << "\"";
                }
                continue;
            }
            ++seen[{writer, index}];
        }
        EXPECT_EQ(broken, 0) << log.filename();
        int missing = 0;
        int doubled = 0;
        for (int w = 0; w < kWriters; ++w) {
            for (int i = 0; i < kLinesEach; ++i) {
                auto found = seen.find({w, i});
                if (found == seen.end()) {
                    ++missing;
                } else if (found->second != 1) {
                    ++doubled;
                }
            }
        }
        EXPECT_EQ(missing, 0) << log.filename();
        EXPECT_EQ(doubled, 0) << log.filename();
        EXPECT_EQ(seen.size(), static_cast<size_t>(kWriters * kLinesEach)) << log.filename();
    }
};

// Threads trace as the reader threads and the main thread do: each line in several pieces,
// ended by std::endl (cout) or '\n' on a unit-buffered stream (cerr), all at once.
TEST_F(RedirectedLogs, LinesFromManyThreadsComeOutWholeAndExactlyOnce) {
    const std::filesystem::path out = dir_ / "lineprobe.log";
    const std::filesystem::path err = dir_ / "lineprobe_err.log";
    ASSERT_TRUE(Redirect(std::cout, out.c_str()));
    ASSERT_TRUE(Redirect(std::cerr, err.c_str()));

    std::vector<std::thread> writers;
    for (int w = 0; w < kWriters; ++w) {
        writers.emplace_back([w] {
            for (int i = 0; i < kLinesEach; ++i) {
                const std::string filler(1 + (i * 7 + w) % 90, 'x');
                std::cout << "trace writer " << w << " line " << i << " " << filler << " end"
                          << std::endl;
                std::cerr << "error writer " << w << " line " << i << " " << filler << " end"
                          << '\n';
            }
        });
    }
    for (std::thread& writer : writers) {
        writer.join();
    }
    std::cout.rdbuf(savedCout_);
    std::cerr.rdbuf(savedCerr_);

    ExpectEveryLineOnce(out, "trace");
    ExpectEveryLineOnce(err, "error");
}

// A line begun but not ended when its thread finishes is neither lost nor spliced into the
// next line that another thread writes.
TEST_F(RedirectedLogs, UnfinishedLineOfAnEndedThreadIsWrittenWhole) {
    const std::filesystem::path out = dir_ / "lineprobe.log";
    ASSERT_TRUE(Redirect(std::cout, out.c_str()));

    std::thread([] { std::cout << "begun " << 1 << " but never ended"; }).join();
    std::cout << "main thread line" << std::endl;
    std::cout.rdbuf(savedCout_);

    std::ifstream file(out);
    std::string text((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    EXPECT_EQ(text, "begun 1 but never ended\nmain thread line\n");
}

}  // namespace
}  // namespace lineprobe
