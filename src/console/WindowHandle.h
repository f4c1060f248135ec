#pragma once

// Lets headers pass curses windows around without pulling in the curses header, which
// would invite drawing calls that bypass the wrapper's lock.
struct _win_st;

namespace lineprobe {
using WindowHandle = ::_win_st*;
}  // namespace lineprobe
