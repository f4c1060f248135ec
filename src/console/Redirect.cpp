#include "console/Redirect.h"

#include <iostream>

namespace lineprobe {

std::ofstream* fout = nullptr;
std::ofstream* ferr = nullptr;
std::streambuf* sbuf_cout = nullptr;
std::streambuf* sbuf_cerr = nullptr;

bool Redirect(std::ostream& stream, const char* fileName) {
    std::ofstream** file = nullptr;
    std::streambuf** saved = nullptr;
    if (&stream == &std::cout) {
        file = &fout;
        saved = &sbuf_cout;
    } else if (&stream == &std::cerr) {
        file = &ferr;
        saved = &sbuf_cerr;
    } else {
        return false;
    }
    *file = new std::ofstream();
    (*file)->open(fileName, std::ios::out | std::ios::trunc);
    if (!(*file)->is_open()) {
        return false;
    }
    *saved = stream.rdbuf();
    stream.rdbuf((*file)->rdbuf());
    return true;
}

}  // namespace lineprobe
