#include "console/CommandTable.h"

#include <gtest/gtest.h>

#include <memory>
#include <set>
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

TEST(CommandTable, MakesOneCommandForEachWordUnderThatWord) {
    const std::vector<std::unique_ptr<Command>> commands = CreateCommands({});

    ASSERT_EQ(commands.size(), COMMAND_TABLE.size());
    std::set<std::string> words;
    for (std::size_t i = 0; i < commands.size(); ++i) {
        ASSERT_NE(commands[i], nullptr) << COMMAND_TABLE[i].word;
        EXPECT_EQ(commands[i]->GetCommandName(), COMMAND_TABLE[i].word);
        words.insert(commands[i]->GetCommandName());
    }
    EXPECT_EQ(words.size(), COMMAND_TABLE.size()) << "a word made twice would shadow a command";
}

TEST(CommandTable, RegistersTheCreatedCommandsInRegistrationOrder) {
    const std::vector<std::unique_ptr<Command>> owned = CreateCommands({});
    std::vector<Command*> created;
    for (const std::unique_ptr<Command>& command : owned) {
        created.push_back(command.get());
    }
    std::vector<std::string> expected(COMMAND_TABLE.size());
    for (const CommandEntry& entry : COMMAND_TABLE) {
        ASSERT_LT(entry.registration, expected.size()) << entry.word;
        EXPECT_TRUE(expected[entry.registration].empty()) << "two words at one place";
        expected[entry.registration] = std::string(entry.word);
    }
    CmdProcessor processor(nullptr);
    LogCapture out;

    RegisterCommands(processor, created);

    EXPECT_EQ(RegisteredNames(out.Text()), expected);
    for (std::size_t i = 0; i < created.size(); ++i) {
        EXPECT_EQ(processor.FindCommand(std::string(COMMAND_TABLE[i].word)), created[i])
            << COMMAND_TABLE[i].word;
    }
}

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
