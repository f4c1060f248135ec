#include "console/CmdProcessor.h"

#include <gtest/gtest.h>

#include "LogCapture.h"
#include "console/Command.h"

namespace lineprobe {
namespace {

using testsupport::LogCapture;

TEST(CmdProcessor, RegisterTracesTheNameAndReturnsZero) {
    CmdProcessor processor(nullptr);
    Command help("help");
    LogCapture out;

    EXPECT_EQ(processor.RegisterCommand(&help), 0);
    EXPECT_EQ(out.Text(), "Calling CmdProcessor::RegisterCommand\ncommand name: help\n");
}

TEST(CmdProcessor, NullCommandIsRefusedSilently) {
    CmdProcessor processor(nullptr);
    LogCapture out;

    EXPECT_EQ(processor.RegisterCommand(nullptr), -2);
    EXPECT_EQ(out.Text(), "");
}

TEST(CmdProcessor, DuplicateNameKeepsFirst) {
    CmdProcessor processor(nullptr);
    Command first("phone");
    Command second("phone");
    LogCapture out;

    EXPECT_EQ(processor.RegisterCommand(&first), 0);
    EXPECT_EQ(processor.RegisterCommand(&second), -1);
    EXPECT_EQ(processor.FindCommand("phone"), &first);
}

TEST(CmdProcessor, FindTracesTheWordAndMatchesExactly) {
    CmdProcessor processor(nullptr);
    Command quit("quit");
    Command trunk("trunk");
    LogCapture out;
    processor.RegisterCommand(&quit);
    processor.RegisterCommand(&trunk);

    EXPECT_EQ(processor.FindCommand("quit"), &quit);
    EXPECT_EQ(processor.FindCommand("trunk"), &trunk);
    for (const char* miss : {"QUIT", "Quit", "qui", "quit ", "trunk_ins", ""}) {
        EXPECT_EQ(processor.FindCommand(miss), nullptr) << "'" << miss << "'";
    }
    EXPECT_NE(out.Text().find("Calling CmdProcessor::FindCommand: cmdStr= QUIT\n"),
              std::string::npos);
}

}  // namespace
}  // namespace lineprobe
