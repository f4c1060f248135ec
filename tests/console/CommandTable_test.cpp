#include "console/CommandTable.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "LogCapture.h"
#include "console/CmdProcessor.h"
#include "console/Command.h"

namespace lineprobe {
namespace {

using testsupport::LogCapture;

std::vector<std::string> RegisteredNames(const std::string& trace) {
    std::vector<std::string> names;
    const std::string marker = "command name: ";
    for (std::size_t at = trace.find(marker); at != std::string::npos;
         at = trace.find(marker, at + 1)) {
        const std::size_t start = at + marker.size();
        names.push_back(trace.substr(start, trace.find('\n', start) - start));
    }
    return names;
}

// The order of the whole table is the start-up's (the terminal test reads it from the log);
// here, what the table does with a command it does not list.
TEST(CommandTable, UnknownWordIsRegisteredLastRatherThanLost) {
    Command extra("selftest");
    Command quit("quit");
    CmdProcessor processor(nullptr);
    LogCapture out;

    RegisterCommands(processor, {&extra, nullptr, &quit});

    EXPECT_EQ(RegisteredNames(out.Text()), (std::vector<std::string>{"quit", "selftest"}));
    EXPECT_EQ(processor.FindCommand("selftest"), &extra);
}

}  // namespace
}  // namespace lineprobe
