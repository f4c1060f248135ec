#include "SimFixture.h"

#include <cstdio>
#include <cstdlib>

#include "platform/farm/ActiveFarm.h"
#include "sim/Builtin.h"

#ifndef LINEPROBE_FARMS_DIR
#error "LINEPROBE_FARMS_DIR must name the farms folder"
#endif

void SimFixture::UseFarm(const std::string& farmFile) {
    sim::stopBuiltinEmulation();
    if (farmFile.empty()) {
        unsetenv(farm::kFarmEnvironment);
    } else {
        setenv(farm::kFarmEnvironment, (LINEPROBE_FARMS_DIR "/" + farmFile).c_str(), 1);
    }
    farm::resetActiveFarm();
    std::string error;
    ASSERT_TRUE(sim::startBuiltinEmulation(&error)) << error;
}

void SimFixture::TearDown() {
    for (unsigned int type : overridden) {
        char line[32];
        std::snprintf(line, sizeof line, "normal %X", type);
        sim::builtinControl(line);
    }
    overridden.clear();
}

std::string SimFixture::Control(const std::string& line) {
    std::string reply = sim::builtinControl(line);
    EXPECT_EQ(reply.rfind("ok", 0), 0u) << line << " -> " << reply;
    return reply;
}

void SimFixture::Refuse(unsigned int type, unsigned int code) {
    char line[48];
    std::snprintf(line, sizeof line, "refuse %X %X", type, code);
    Control(line);
    overridden.push_back(type);
}

void SimFixture::Silence(unsigned int type) {
    char line[32];
    std::snprintf(line, sizeof line, "silence %X", type);
    Control(line);
    overridden.push_back(type);
}
