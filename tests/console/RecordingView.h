#pragma once

#include <algorithm>
#include <iterator>
#include <string>
#include <vector>

#include "console/ConsoleDisplay.h"
#include "console/View.h"

namespace lineprobe::testing {

// A View that keeps what is drawn on it instead of handing it to curses: each call in
// order, and the resulting text of every row as a window of `cols` columns would hold it
// (text past the last column is cut, tabs are kept as characters). Built without a
// started display, so its curses window is null and never touched.
class RecordingView : public View {
  public:
    struct Call {
        std::string what;  // "print", "refresh", "clear"
        int row;
        int col;
        std::string text;
    };

    explicit RecordingView(int rows = 10, int cols = 100)
        : View(ConsoleDisplay::GetDisplay(), rows, cols, 0, 0),
          cols_(cols),
          screen_(static_cast<std::size_t>(rows),
                  std::string(static_cast<std::size_t>(cols), ' ')) {}

    int PrintString(const char* text, int row, int col) override {
        calls.push_back({"print", row, col, text});
        if (row >= 0 && row < static_cast<int>(screen_.size()) && col >= 0) {
            std::string& line = screen_[static_cast<std::size_t>(row)];
            for (std::size_t i = 0; text[i] != '\0' && col + static_cast<int>(i) < cols_; ++i) {
                line[static_cast<std::size_t>(col) + i] = text[i];
            }
        }
        return 0;
    }
    void Refresh() override { calls.push_back({"refresh", 0, 0, ""}); }
    int ClearToEOL(int row, int col) override {
        calls.push_back({"clear", row, col, ""});
        if (row >= 0 && row < static_cast<int>(screen_.size()) && col >= 0 && col < cols_) {
            std::string& line = screen_[static_cast<std::size_t>(row)];
            line.replace(static_cast<std::size_t>(col), line.size() - static_cast<std::size_t>(col),
                         line.size() - static_cast<std::size_t>(col), ' ');
        }
        return 0;
    }
    int SetReverseVideo() override { return 0; }
    int SetNormalVideo() override { return 0; }

    // The text of the row from `col`, `length` characters.
    std::string At(int row, int col, std::size_t length) const {
        return screen_[static_cast<std::size_t>(row)].substr(static_cast<std::size_t>(col), length);
    }
    std::string Row(int row) const { return screen_[static_cast<std::size_t>(row)]; }
    int Refreshes() const {
        return static_cast<int>(std::count_if(calls.begin(), calls.end(),
                                              [](const Call& c) { return c.what == "refresh"; }));
    }
    std::vector<Call> Prints() const {
        std::vector<Call> out;
        std::copy_if(calls.begin(), calls.end(), std::back_inserter(out),
                     [](const Call& c) { return c.what == "print"; });
        return out;
    }

    std::vector<Call> calls;

  private:
    int cols_;
    std::vector<std::string> screen_;
};

}  // namespace lineprobe::testing
