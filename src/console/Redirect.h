#pragma once

#include <fstream>
#include <ostream>
#include <streambuf>

namespace lineprobe {

// The log files behind std::cout and std::cerr, and the buffers the two streams had
// before. Set once at start-up and kept until the process ends: the streams stay
// redirected to the last line, the shutdown trace included.
extern std::ofstream* fout;
extern std::ofstream* ferr;
extern std::streambuf* sbuf_cout;
extern std::streambuf* sbuf_cerr;

// Points std::cout or std::cerr at a file of the working directory, truncating it. Every
// line then reaches the file whole and once, whichever threads write at the same time: a
// thread's text is held until it ends its line. False for any other stream or when the file
// cannot be opened.
bool Redirect(std::ostream& stream, const char* fileName);

}  // namespace lineprobe
