#include <csignal>
#include <exception>
#include <iostream>
#include <memory>
#include <vector>

#include <cstdlib>

#include "console/CmdProcessor.h"
#include "console/Command.h"
#include "console/CommandTable.h"
#include "console/ConsoleDisplay.h"
#include "console/ConsoleLayout.h"
#include "console/ConsoleSystemView.h"
#include "console/Lifecycle.h"
#include "console/PhoneViewMgr.h"
#include "console/Redirect.h"
#include "console/RelayStatus.h"
#include "console/TrunkViewMgr.h"
#include "console/View.h"
#include "framework/tolk.h"
#include "sim/Builtin.h"

using namespace lineprobe;

int main(int argc, char* argv[]) {
    if (argc > 1) {
        ProcessCmdLineArgs(argc - 1, argv + 1);
        return 0;
    }

    std::set_terminate(ReportUncaughtAndAbort);

    // A terminal that hangs up ends the tool as the closed keyboard below does.
    if (signal(SIGINT, terminate_app) == SIG_ERR || signal(SIGTERM, terminate_app) == SIG_ERR ||
        signal(SIGUSR1, terminate_app) == SIG_ERR || signal(SIGHUP, terminate_app) == SIG_ERR) {
        std::cerr << "unable to register signal handlers" << std::endl;
        return 1;
    }

    tolk::tolkInit();

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

    // Without a relay host the boards are those of the farm, played in this process. A
    // broken farm is reported in the error log and leaves the tool without boards.
    if (std::getenv("REMOTE_TKHOST") == nullptr) {
        std::string error;
        if (!sim::startBuiltinEmulation(&error)) {
            std::cerr << "board emulation not started: " << error << std::endl;
        }
    }

    WatchRelayState();

    g_sysView = new ConsoleSystemView();
    g_SystemView = new View(g_curDisplay, SYSVIEW_WINDOW_HEIGHT, SYSVIEW_WINDOW_WIDTH,
                            SYSVIEW_STARTING_ROW, SYSVIEW_STARTING_COL);
    g_sysView->SetView(g_SystemView);
    g_sysView->Display();

    g_curDisplay->DrawHorizontalLine(SYSVIEW_SEPARATOR_ROW, STARTING_COL, MIN_COLS);
    g_curDisplay->Refresh();

    View* phoneViewsWindow =
        new View(g_curDisplay, PHONEVIEWS_WINDOW_HEIGHT, PHONEVIEWS_WINDOW_WIDTH,
                 PHONEVIEWS_WINDOW_STARTING_ROW, PHONEVIEWS_WINDOW_STARTING_COL);
    g_phoneViewMgr = PhoneViewMgr::CreatePhoneViewMgr(phoneViewsWindow);
    phoneViewsWindow->Refresh();

    g_curDisplay->DrawHorizontalLine(PHONEVIEWS_SEPARATOR_ROW, STARTING_COL, MIN_COLS);

    g_TrunkViewWindow = new View(g_curDisplay, TRUNKVIEWS_WINDOW_HEIGHT, TRUNKVIEWS_WINDOW_WIDTH,
                                 TRUNKVIEWS_WINDOW_STARTING_ROW, TRUNKVIEWS_WINDOW_STARTING_COL);
    g_trunkViewMgr = TrunkViewMgr::CreateTrunkViewMgr(g_TrunkViewWindow);
    g_TrunkViewWindow->Refresh();

    g_curDisplay->DrawHorizontalLine(TRUNKVIEWS_SEPARATOR_ROW, STARTING_COL, MIN_COLS);

    g_CmdProcessorView =
        new View(g_curDisplay, CMDPROCESSOR_VIEW_WINDOW_HEIGHT, CMDPROCESSOR_VIEW_WINDOW_WIDTH,
                 CMDPROCESSOR_VIEW_WINDOW_STARTING_ROW, CMDPROCESSOR_VIEW_WINDOW_STARTING_COL);
    CmdProcessor processor(g_CmdProcessorView);

    // The commands live until the process ends: every end leaves through terminate_app.
    const std::vector<std::unique_ptr<Command>> commands =
        CreateCommands({g_phoneViewMgr, g_trunkViewMgr});
    std::vector<Command*> table;
    for (const std::unique_ptr<Command>& command : commands) {
        table.push_back(command.get());
    }
    RegisterCommands(processor, table);

    processor.ProcessCommands();

    // The loop ends by itself only when the keyboard is gone for good, as when the
    // terminal hangs up: the views are stopped all the same.
    terminate_app(SIGHUP);
    return 1;
}
