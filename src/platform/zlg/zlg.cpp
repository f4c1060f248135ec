#include "platform/zlg/zlg.h"

#include <fcntl.h>
#include <sys/time.h>
#include <unistd.h>

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <mutex>
#include <string>
#include <vector>

namespace {

std::mutex g_lock;
std::vector<std::string> g_modules;  // handle n is g_modules[n - 1]
std::vector<std::string> g_labels;

int handleFor(std::vector<std::string>& names, const char* name, ZLG_HANDLE* handle) {
    if (!name || !*name || !handle) {
        return ZLG_ERR_INVALID_ARGUMENT;
    }
    std::lock_guard<std::mutex> guard(g_lock);
    for (std::size_t i = 0; i < names.size(); ++i) {
        if (names[i] == name) {
            *handle = static_cast<ZLG_HANDLE>(i + 1);
            return ZLG_SUCCESS;
        }
    }
    if (names.size() >= ZLG_MAX_NAMES) {
        return ZLG_ERR_TABLE_FULL;
    }
    names.emplace_back(name);
    *handle = static_cast<ZLG_HANDLE>(names.size());
    return ZLG_SUCCESS;
}

std::string timestamp() {
    timeval tv{};
    ::gettimeofday(&tv, nullptr);
    std::tm tm{};
    ::localtime_r(&tv.tv_sec, &tm);
    char buf[40];
    std::size_t n = std::strftime(buf, sizeof buf, "%Y-%m-%d %H:%M:%S", &tm);
    std::snprintf(buf + n, sizeof buf - n, ".%03ld", static_cast<long>(tv.tv_usec / 1000));
    return buf;
}

// The caller holds g_lock, so lines from different threads never interleave.
int appendLine(const std::string& tag, const char* text) {
    std::string line = timestamp() + " " + tag + ": " + text;
    for (char& c : line) {
        if (c == '\n' || c == '\r') {
            c = ' ';
        }
    }
    line += '\n';
    const char* path = std::getenv(ZLG_TRACE_FILE_ENV);
    if (!path || !*path) {
        path = ZLG_DEFAULT_TRACE_FILE;
    }
    int fd = ::open(path, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0644);
    if (fd < 0) {
        return ZLG_ERR_WRITE_FAILED;
    }
    std::size_t done = 0;
    int status = ZLG_SUCCESS;
    while (done < line.size()) {
        ssize_t n = ::write(fd, line.data() + done, line.size() - done);
        if (n < 0 && errno == EINTR) {
            continue;
        }
        if (n <= 0) {
            status = ZLG_ERR_WRITE_FAILED;
            break;
        }
        done += static_cast<std::size_t>(n);
    }
    ::close(fd);
    return status;
}

}  // namespace

extern "C" int ZlgGetModuleHandle(const char* moduleName, ZLG_HANDLE* handle) {
    return handleFor(g_modules, moduleName, handle);
}

extern "C" int ZlgGetLabelHandle(const char* labelName, ZLG_HANDLE* handle) {
    return handleFor(g_labels, labelName, handle);
}

extern "C" int ZlgTraceMessageVarg(const char* format, ...) {
    if (!format) {
        return ZLG_ERR_INVALID_ARGUMENT;
    }
    va_list args;
    va_start(args, format);
    va_list again;
    va_copy(again, args);
    int needed = std::vsnprintf(nullptr, 0, format, args);
    va_end(args);
    std::string text(needed > 0 ? static_cast<std::size_t>(needed) : 0, '\0');
    if (needed > 0) {
        std::vsnprintf(text.data(), text.size() + 1, format, again);
    }
    va_end(again);
    std::lock_guard<std::mutex> guard(g_lock);
    return appendLine("-", text.c_str());
}

extern "C" int ZlgTraceNoClient(ZLG_HANDLE module, ZLG_HANDLE label, const char* text) {
    if (!text) {
        return ZLG_ERR_INVALID_ARGUMENT;
    }
    std::lock_guard<std::mutex> guard(g_lock);
    if (module < 1 || module > g_modules.size() || label < 1 || label > g_labels.size()) {
        return ZLG_ERR_INVALID_HANDLE;
    }
    return appendLine(g_modules[module - 1] + "/" + g_labels[label - 1], text);
}
