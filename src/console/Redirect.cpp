#include "console/Redirect.h"

#include <fcntl.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <chrono>
#include <iostream>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

namespace lineprobe {

std::ofstream* fout = nullptr;
std::ofstream* ferr = nullptr;
std::streambuf* sbuf_cout = nullptr;
std::streambuf* sbuf_cerr = nullptr;

namespace {

// Longest a writer waits for another to finish its line. Only a holder stuck in write(2) (a log
// on a hung file system), or one that a signal handler interrupted on its own thread just as
// it took or gave up the lock, keeps it that long; the shutdown's trace must reach the file all
// the same, so the line then goes out without the lock, still in a single write to an
// append-only descriptor.
constexpr std::chrono::milliseconds kWriteWait{1000};

// A line that grows past this without an end goes out as it is, so that a runaway trace
// cannot take the memory of the thread that writes it.
constexpr std::size_t kLongestLine = 64 * 1024;

// One log file, shared by every thread: each call reaches the file as one write(2).
class LogFile {
  public:
    explicit LogFile(int fd) : fd(fd) {}
    ~LogFile() { ::close(fd); }
    LogFile(const LogFile&) = delete;
    LogFile& operator=(const LogFile&) = delete;

    void Write(const char* data, std::size_t size) {
        const bool locked = owner.load() != std::this_thread::get_id() && Lock();
        if (locked) {
            owner.store(std::this_thread::get_id());
        }
        while (size > 0) {
            ssize_t written = ::write(fd, data, size);
            if (written < 0) {
                if (errno == EINTR) {
                    continue;
                }
                break;  // nowhere left to report a log that cannot be written
            }
            data += written;
            size -= static_cast<std::size_t>(written);
        }
        if (locked) {
            owner.store(std::thread::id{});
            lock.unlock();
        }
    }

  private:
    // Polls rather than using a timed lock: the standard library's timed wait goes through a
    // call that thread checkers do not follow. A holder keeps the lock for one write(2), so a
    // few yields nearly always do; past them the wait sleeps in short steps.
    bool Lock() {
        if (lock.try_lock()) {
            return true;
        }
        const auto deadline = std::chrono::steady_clock::now() + kWriteWait;
        for (unsigned int tries = 0;; ++tries) {
            if (tries < 64) {
                std::this_thread::yield();
            } else {
                std::this_thread::sleep_for(std::chrono::microseconds(200));
            }
            if (lock.try_lock()) {
                return true;
            }
            if (std::chrono::steady_clock::now() >= deadline) {
                return false;
            }
        }
    }

    std::mutex lock;
    std::atomic<std::thread::id> owner{};
    int fd;
};

// What one thread has written of its current line, per log file. A line is kept here until
// its end, so that no other thread's text can land in the middle of it.
class ThreadLines {
  public:
    ~ThreadLines() {
        // A thread that ends in the middle of a line: the line is ended for it.
        for (auto& [file, text] : pending) {
            text += '\n';
            file->Write(text.data(), text.size());
        }
    }

    std::string& For(const std::shared_ptr<LogFile>& file) {
        for (auto& entry : pending) {
            if (entry.first == file) {
                return entry.second;
            }
        }
        pending.emplace_back(file, std::string());
        return pending.back().second;
    }

    // Only lines in progress are kept: a thread that has ended its lines holds no file.
    void Forget(const std::shared_ptr<LogFile>& file) {
        for (auto entry = pending.begin(); entry != pending.end(); ++entry) {
            if (entry->first == file) {
                pending.erase(entry);
                return;
            }
        }
    }

    bool busy = false;

  private:
    std::vector<std::pair<std::shared_ptr<LogFile>, std::string>> pending;
};

thread_local ThreadLines t_lines;

// The buffer under std::cout or std::cerr once redirected. It has no put area of its own:
// every character comes through xsputn or overflow, which keep each thread's text apart until
// the thread ends its line.
class LineBuffer : public std::streambuf {
  public:
    explicit LineBuffer(std::shared_ptr<LogFile> file) : file(std::move(file)) {}

  protected:
    std::streamsize xsputn(const char* text, std::streamsize count) override {
        if (count > 0) {
            Put(text, static_cast<std::size_t>(count));
        }
        return count;
    }

    int_type overflow(int_type ch) override {
        if (traits_type::eq_int_type(ch, traits_type::eof())) {
            return traits_type::not_eof(ch);
        }
        const char c = traits_type::to_char_type(ch);
        Put(&c, 1);
        return ch;
    }

    // Flushing writes nothing: whole lines are already in the file, and the unfinished one
    // stays with its thread (std::cerr flushes after every insertion).
    int sync() override { return 0; }

  private:
    void Put(const char* text, std::size_t count) {
        ThreadLines& lines = t_lines;
        // A signal handler that interrupted this thread inside Put: its text cannot join the
        // line being built, so it goes out by itself.
        if (lines.busy) {
            file->Write(text, count);
            return;
        }
        lines.busy = true;
        try {
            std::string& line = lines.For(file);
            line.append(text, count);
            const std::size_t end = line.rfind('\n');
            if (end != std::string::npos) {
                file->Write(line.data(), end + 1);
                line.erase(0, end + 1);
            } else if (line.size() >= kLongestLine) {
                file->Write(line.data(), line.size());
                line.clear();
            }
            if (line.empty()) {
                lines.Forget(file);
            }
        } catch (const std::bad_alloc&) {
            // No room to hold the text back: better out of turn than lost, and a stream
            // that saw an exception here would stay bad for good.
            file->Write(text, count);
        }
        lines.busy = false;
    }

    std::shared_ptr<LogFile> file;
};

// Every buffer ever installed. Like the file streams they are never freed: threads may trace
// up to the last moment of exit, after static destruction has begun.
std::vector<std::unique_ptr<LineBuffer>>& Installed() {
    static auto* buffers = new std::vector<std::unique_ptr<LineBuffer>>();
    return *buffers;
}

}  // namespace

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
    // The file stream made and truncated the file; the lines go through a descriptor of
    // their own, which appends each in one piece whoever else writes.
    const int fd = ::open(fileName, O_WRONLY | O_APPEND | O_CLOEXEC);
    if (fd < 0) {
        return false;
    }
    Installed().push_back(std::make_unique<LineBuffer>(std::make_shared<LogFile>(fd)));
    *saved = stream.rdbuf();
    stream.rdbuf(Installed().back().get());
    return true;
}

}  // namespace lineprobe
