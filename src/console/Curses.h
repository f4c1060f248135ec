#pragma once

// The only way into the curses library. ConsoleDisplay, ConsoleWindow and View include
// this from their sources; nothing else in the program may, so that every curses call
// goes through the wrapper and its lock.
#include <curses.h>

#include <type_traits>

#include "console/WindowHandle.h"

static_assert(std::is_same_v<lineprobe::WindowHandle, WINDOW*>,
              "WindowHandle must name the curses window type");
