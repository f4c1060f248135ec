#pragma once

#include <cstddef>
#include <deque>
#include <string>

namespace lineprobe {

// Lines recalled with Up and Down: the most recent ones of this run.
constexpr std::size_t LINE_HISTORY_SIZE = 100;

// The prompt's line editor, apart from the terminal: fed one key at a time, it keeps the
// line, the cursor within it and the lines entered before, and tells which part of a long
// line a row of a given width shows. Keys are character codes, with the editing keys that
// have no character of their own given as the constants below.
//
// Tab becomes a blank, since both only ever separate fields of a command line. Other
// control characters and unknown keys are ignored. Typing past the length limit is
// dropped.
class LineEditor {
  public:
    // Beyond every character code, so that no typed character can be taken for one.
    enum EditKey : int {
        Left = 0x110000,
        Right,
        Home,
        End,
        Up,
        Down,
        Backspace,
        Delete,
    };

    enum class Result { Editing, Entered };

    // The part of the line a row shows, and the cursor's column within that row.
    struct Visible {
        std::string text;
        std::size_t cursor = 0;
    };

    // Begins a new, empty line of at most `maxLength` characters.
    void Start(std::size_t maxLength);

    // Enter finishes the line: it is kept for recall unless blank or the same as the
    // line entered last, and stays readable through Line() until the next Start.
    Result Feed(int key);

    const std::string& Line() const { return line_; }
    std::size_t Cursor() const { return cursor_; }

    // What a row of `width` columns shows: it scrolls sideways only as far as needed to
    // keep the cursor in view, and keeps a cell free behind the last character for the
    // cursor at the end of the line.
    Visible Show(std::size_t width);

  private:
    void Insert(char c);
    void Recall(std::size_t position);

    std::string line_;
    std::size_t cursor_ = 0;
    std::size_t maxLength_ = 0;
    std::size_t scroll_ = 0;

    std::deque<std::string> history_;
    // Index into history_ of the line recalled; history_.size() while on the new line,
    // whose text is kept in draft_ while older lines are looked at.
    std::size_t recalled_ = 0;
    std::string draft_;
};

}  // namespace lineprobe
