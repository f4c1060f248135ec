#include "console/LineEditor.h"

#include <algorithm>

namespace lineprobe {

namespace {

constexpr int CTRL_A = 0x01;
constexpr int CTRL_E = 0x05;
constexpr int CTRL_H = 0x08;
constexpr int TAB = 0x09;
constexpr int CTRL_U = 0x15;
constexpr int CTRL_W = 0x17;
constexpr int DEL = 0x7f;

bool IsEnter(int key) {
    return key == '\n' || key == '\r';
}

bool IsPrintable(int key) {
    return key >= 0x20 && key < 0x7f;
}

}  // namespace

void LineEditor::Start(std::size_t maxLength) {
    line_.clear();
    cursor_ = 0;
    scroll_ = 0;
    maxLength_ = maxLength;
    recalled_ = history_.size();
    draft_.clear();
}

LineEditor::Result LineEditor::Feed(int key) {
    if (IsEnter(key)) {
        const bool blank = line_.find_first_not_of(' ') == std::string::npos;
        if (!blank && (history_.empty() || history_.back() != line_)) {
            history_.push_back(line_);
            if (history_.size() > LINE_HISTORY_SIZE) {
                history_.pop_front();
            }
        }
        recalled_ = history_.size();
        return Result::Entered;
    }
    switch (key) {
        case TAB:
            Insert(' ');
            break;
        case Backspace:
        case DEL:
        case CTRL_H:
            if (cursor_ > 0) {
                line_.erase(--cursor_, 1);
            }
            break;
        case Delete:
            if (cursor_ < line_.size()) {
                line_.erase(cursor_, 1);
            }
            break;
        case Left:
            cursor_ -= cursor_ > 0 ? 1 : 0;
            break;
        case Right:
            cursor_ += cursor_ < line_.size() ? 1 : 0;
            break;
        case Home:
        case CTRL_A:
            cursor_ = 0;
            break;
        case End:
        case CTRL_E:
            cursor_ = line_.size();
            break;
        case CTRL_U:
            line_.erase(0, cursor_);
            cursor_ = 0;
            break;
        case CTRL_W: {
            // The word behind the cursor, with the blanks between it and the cursor.
            std::size_t start = cursor_;
            while (start > 0 && line_[start - 1] == ' ') {
                --start;
            }
            while (start > 0 && line_[start - 1] != ' ') {
                --start;
            }
            line_.erase(start, cursor_ - start);
            cursor_ = start;
            break;
        }
        case Up:
            if (recalled_ > 0) {
                Recall(recalled_ - 1);
            }
            break;
        case Down:
            if (recalled_ < history_.size()) {
                Recall(recalled_ + 1);
            }
            break;
        default:
            if (IsPrintable(key)) {
                Insert(static_cast<char>(key));
            }
            break;
    }
    return Result::Editing;
}

void LineEditor::Insert(char c) {
    if (line_.size() >= maxLength_) {
        return;
    }
    line_.insert(cursor_++, 1, c);
}

void LineEditor::Recall(std::size_t position) {
    if (recalled_ == history_.size()) {
        draft_ = line_;
    }
    recalled_ = position;
    line_ = recalled_ == history_.size() ? draft_ : history_[recalled_];
    if (line_.size() > maxLength_) {
        line_.resize(maxLength_);
    }
    cursor_ = line_.size();
}

LineEditor::Visible LineEditor::Show(std::size_t width) {
    if (width == 0) {
        return {};
    }
    // Never scrolled further than needed to show the end of the line and the cell after
    // it, so that deleting brings text back into view from the left.
    const std::size_t furthest = line_.size() + 1 > width ? line_.size() + 1 - width : 0;
    scroll_ = std::min(scroll_, furthest);
    if (cursor_ < scroll_) {
        scroll_ = cursor_;
    } else if (cursor_ >= scroll_ + width) {
        scroll_ = cursor_ + 1 - width;
    }
    return {line_.substr(scroll_, width), cursor_ - scroll_};
}

}  // namespace lineprobe
