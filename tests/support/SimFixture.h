#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

// Runs the tests of a suite against the built-in board emulation of one farm, and puts back
// every message type a test made the boards refuse or ignore.
class SimFixture : public ::testing::Test {
  public:
    // Empty for the built-in default farm, else a file under farms/.
    static void UseFarm(const std::string& farmFile);

  protected:
    void TearDown() override;
    // Runs a control line and expects it to be accepted.
    std::string Control(const std::string& line);
    void Refuse(unsigned int type, unsigned int code = 0x1);
    void Silence(unsigned int type);

  private:
    std::vector<unsigned int> overridden;
};
