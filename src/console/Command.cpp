#include "console/Command.h"

#include "console/View.h"

namespace lineprobe {

namespace {

constexpr int RESULT_ROW = 2;
constexpr int RESULT_COL = 1;

}  // namespace

std::string Command::GetCommandName() {
    return name_;
}

int Command::Execute() {
    return 0;
}

int Command::Execute(int, int) {
    return 0;
}

int Command::Execute(int, int, int) {
    return 0;
}

int Command::Execute(int, int, int, char*) {
    return 0;
}

int Command::Execute(std::string) {
    return 0;
}

void Command::Report(const char* text) {
    if (view_ != nullptr) {
        view_->PrintString(text, RESULT_ROW, RESULT_COL);
    }
}

void Command::RefreshView() {
    if (view_ != nullptr) {
        view_->Refresh();
    }
}

void Command::Show(const Outcome& outcome) {
    if (outcome.text != nullptr) {
        Report(outcome.text);
    }
    if (outcome.refresh) {
        RefreshView();
    }
}

void Command::SetView(View* view) {
    if (view != nullptr) {
        view_ = view;
    }
}

}  // namespace lineprobe
