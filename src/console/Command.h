#pragma once

#include <string>
#include <utility>

namespace lineprobe {

class View;

// A command of the prompt. The processor calls the Execute overload that matches the
// number of fields the operator typed; a command gives a field count meaning by
// overriding that overload. The base versions do nothing and return 0. A result other
// than 0 tells the processor to stop. Commands live until the process ends.
class Command {
  public:
    explicit Command(std::string name) : name_(std::move(name)) {}
    // Whoever owns a command owns it through this base.
    virtual ~Command() = default;

    virtual std::string GetCommandName();
    virtual int Execute();
    virtual int Execute(int board, int line);
    virtual int Execute(int board, int line, int chan);
    virtual int Execute(int board, int line, int chan, char* text);
    virtual int Execute(std::string text);

    // The window on which the command reports; a null view is ignored.
    void SetView(View* view);

  protected:
    // One-line result at row 2, column 1 of the command window, and its refresh.
    void Report(const char* text);
    void RefreshView();

    // What the command window shows once a command has acted: its result text, if any, and
    // whether the window is refreshed at all (some commands leave it to the next prompt).
    struct Outcome {
        const char* text;
        bool refresh;
    };
    static constexpr Outcome Shown(const char* text) { return {text, true}; }
    static constexpr Outcome RefreshedOnly() { return {nullptr, true}; }
    static constexpr Outcome Silent() { return {nullptr, false}; }
    void Show(const Outcome& outcome);

    View* view_ = nullptr;
    std::string name_;
};

}  // namespace lineprobe
