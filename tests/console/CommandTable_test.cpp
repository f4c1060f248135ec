#include "console/CommandTable.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "CoutCapture.h"
#include "console/CmdProcessor.h"
#include "console/Command.h"

namespace lineprobe {
namespace {

using lineprobe::testing::CoutCapture;

const std::vector<std::string> CREATION = {
    "quit",       "help",      "phone",      "trunk",    "delphone", "makecall",
    "answer",     "accept",    "drop",       "release",  "chan_oos", "chan_ins",
    "trunk_ins",  "trunk_oos", "origaddr",   "destaddr", "deltrunk", "reset",
    "disablelbk", "linelbk",   "payloadlbk", "startrai", "stoprai"};

const std::vector<std::string> REGISTRATION = {
    "quit",       "help",      "phone",      "delphone", "trunk",    "makecall",
    "answer",     "accept",    "drop",       "release",  "chan_oos", "chan_ins",
    "trunk_ins",  "trunk_oos", "origaddr",   "destaddr", "deltrunk", "reset",
    "disablelbk", "linelbk",   "payloadlbk", "startrai", "stoprai"};

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

TEST(CommandTable, HoldsEveryWordInCreationAndRegistrationOrder) {
    EXPECT_EQ(
        std::vector<std::string>(COMMAND_CREATION_ORDER.begin(), COMMAND_CREATION_ORDER.end()),
        CREATION);
    EXPECT_EQ(std::vector<std::string>(COMMAND_REGISTRATION_ORDER.begin(),
                                       COMMAND_REGISTRATION_ORDER.end()),
              REGISTRATION);
}

TEST(CommandTable, RegistersCreatedCommandsInRegistrationOrder) {
    std::vector<std::unique_ptr<Command>> owned;
    std::vector<Command*> created;
    for (const std::string& name : CREATION) {
        owned.push_back(std::make_unique<Command>(name));
        created.push_back(owned.back().get());
    }
    CmdProcessor processor(nullptr);
    CoutCapture out;

    RegisterCommands(processor, created);

    EXPECT_EQ(RegisteredNames(out.Text()), REGISTRATION);
    for (std::size_t i = 0; i < CREATION.size(); ++i) {
        EXPECT_EQ(processor.FindCommand(CREATION[i]), created[i]) << CREATION[i];
    }
}

TEST(CommandTable, TheCommandsOfTodayKeepTheirPlaces) {
    Command trunk("trunk");
    Command quit("quit");
    Command delphone("delphone");
    Command help("help");
    CmdProcessor processor(nullptr);
    CoutCapture out;

    RegisterCommands(processor, {&trunk, &quit, &delphone, &help});

    EXPECT_EQ(RegisteredNames(out.Text()),
              (std::vector<std::string>{"quit", "help", "delphone", "trunk"}));
}

TEST(CommandTable, UnknownWordIsRegisteredLastRatherThanLost) {
    Command extra("selftest");
    Command quit("quit");
    CmdProcessor processor(nullptr);
    CoutCapture out;

    RegisterCommands(processor, {&extra, nullptr, &quit});

    EXPECT_EQ(RegisteredNames(out.Text()), (std::vector<std::string>{"quit", "selftest"}));
    EXPECT_EQ(processor.FindCommand("selftest"), &extra);
}

}  // namespace
}  // namespace lineprobe
