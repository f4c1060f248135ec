// The emulation served in-process: plugged behind the local switch, so that a program without
// REMOTE_TKHOST talks to the boards of the farm as if they were in the machine.
#pragma once

#include <memory>
#include <string>

#include "platform/farm/Farm.h"

namespace sim {

// Loads the active farm (VX7_FARM or the built-in default) and attaches the emulation to the
// switch, on a thread of its own. False, with the farm's one-line error, if the farm is broken;
// the switch then has no boards. Starting twice keeps the running one.
bool startBuiltinEmulation(std::string* error = nullptr);
// The same with a given farm.
bool startBuiltinEmulation(std::shared_ptr<const farm::Farm> farm);
// Detaches from the switch and ends the thread; what was still queued is dropped.
void stopBuiltinEmulation();
bool builtinEmulationRunning();
// Runs one control line on the emulation's thread (see Control.h) and returns its answer;
// "error: ..." if the emulation is not running.
std::string builtinControl(const std::string& line);

}  // namespace sim
