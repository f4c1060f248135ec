#include <csignal>
#include <iostream>

#include "console/CmdProcessor.h"
#include "console/CommandTable.h"
#include "console/ConsoleDisplay.h"
#include "console/ConsoleLayout.h"
#include "console/HelpCmd.h"
#include "console/Lifecycle.h"
#include "console/QuitCmd.h"
#include "console/Redirect.h"
#include "console/View.h"

using namespace lineprobe;

int main(int argc, char* argv[]) {
    if (argc > 1) {
        ProcessCmdLineArgs(argc - 1, argv + 1);
        return 0;
    }

    if (signal(SIGINT, terminate_app) == SIG_ERR || signal(SIGTERM, terminate_app) == SIG_ERR ||
        signal(SIGUSR1, terminate_app) == SIG_ERR) {
        std::cerr << "unable to register signal handlers" << std::endl;
        return 1;
    }

    // tolk::tolkInit() comes here once the messaging framework joins the console.

    g_curDisplay = ConsoleDisplay::GetDisplay();
    if (g_curDisplay == nullptr) {
        std::cerr << " couldn't create diplay" << std::endl;
        return 1;
    }
    if (g_curDisplay->Start(MIN_COLS, MIN_ROWS) != 0) {
        g_curDisplay->Stop();
        return 1;
    }

    // Only now, after the size check has spoken on the terminal: each run starts both
    // logs afresh.
    if (!Redirect(std::cout, "lineprobe.log")) {
        std::cerr << "unable to redirect cout" << std::endl;
        return 1;
    }
    if (!Redirect(std::cerr, "lineprobe_err.log")) {
        std::cerr << "unable to redirect cerr" << std::endl;
        return 1;
    }

    // The system view joins here with the board model: ConsoleSystemView walks the boards
    // and fills a View of SYSVIEW_WINDOW_HEIGHT by SYSVIEW_WINDOW_WIDTH at
    // SYSVIEW_STARTING_ROW, SYSVIEW_STARTING_COL.

    g_curDisplay->DrawHorizontalLine(SYSVIEW_SEPARATOR_ROW, STARTING_COL, MIN_COLS);
    g_curDisplay->Refresh();

    // The phone views window and PhoneViewMgr::CreatePhoneViewMgr join here with the views.

    g_curDisplay->DrawHorizontalLine(PHONEVIEWS_SEPARATOR_ROW, STARTING_COL, MIN_COLS);

    // The trunk views window and TrunkViewMgr::CreateTrunkViewMgr join here with the views.

    g_curDisplay->DrawHorizontalLine(TRUNKVIEWS_SEPARATOR_ROW, STARTING_COL, MIN_COLS);

    g_CmdProcessorView =
        new View(g_curDisplay, CMDPROCESSOR_VIEW_WINDOW_HEIGHT, CMDPROCESSOR_VIEW_WINDOW_WIDTH,
                 CMDPROCESSOR_VIEW_WINDOW_STARTING_ROW, CMDPROCESSOR_VIEW_WINDOW_STARTING_COL);
    CmdProcessor processor(g_CmdProcessorView);

    // Created in the order of COMMAND_CREATION_ORDER. The 21 phone and trunk commands
    // (each given its view manager) join between help and the end of this list with the
    // views; RegisterCommands already knows their places.
    std::vector<Command*> commands;
    commands.push_back(new QuitCmd("quit"));
    commands.push_back(new HelpCmd("help", "lineprobe_help.txt"));
    RegisterCommands(processor, commands);

    processor.ProcessCommands();

    g_curDisplay->Stop();
    return 0;
}
