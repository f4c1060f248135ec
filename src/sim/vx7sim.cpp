// vx7sim: the board emulation of a farm, served to lineprobe and tests over the relay protocol.
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iostream>
#include <sstream>
#include <string>
#include <vector>

#include "platform/farm/ActiveFarm.h"
#include "platform/farm/FarmParser.h"
#include "sim/Control.h"
#include "sim/RelayServer.h"

namespace {

const char* kUsage =
    "usage: vx7sim [--farm FILE] [--port PORT] [--bind ADDRESS] [--max-queued MIB] [--trace]\n"
    "              [--script FILE]\n"
    "\n"
    "Serves the board emulation of a farm on TCP with the relay protocol of the host\n"
    "transport, so that lineprobe can reach the boards with REMOTE_TKHOST=host:PORT.\n"
    "\n"
    "  --farm FILE      the farm to play (default: VX7_FARM, else the built-in default farm,\n"
    "                   the same as farms/default.toml)\n"
    "  --port PORT      TCP port, default 6554; 0 picks a free one\n"
    "  --bind ADDRESS   IPv4 address to listen on, default 0.0.0.0 (every interface)\n"
    "  --max-queued MIB answers and events that all clients together may leave unread, in\n"
    "                   MiB, default 256; past it the client with the most unread is cut off\n"
    "                   (each one is also cut off alone at 64 MiB)\n"
    "  --trace          one line on standard error for each message routed, as it passes:\n"
    "                   \"trace in|out conn N SOURCE -> TARGET TYPE trans ID BODY\"; in is from\n"
    "                   connection N, out is to it; addresses read nNODE.bBOARD.pPROCESSOR.\n"
    "                   cCOMPONENT.iINSTANCE; an event's TYPE is followed by its group's name;\n"
    "                   BODY is the catalogue's text form of the body (standard output\n"
    "                   keeps to the control channel's answers)\n"
    "  --script FILE    play a scenario: control commands as below, one a line, with\n"
    "                   \"sleep MS\" lines between them, '#' comment lines and blank lines. It\n"
    "                   starts when vx7sim starts listening; each command's answer goes to\n"
    "                   standard error as \"vx7sim: script line N: COMMAND: ANSWER\"; at its\n"
    "                   end vx7sim goes on serving. Every line is checked first: a bad one is\n"
    "                   reported with its line number and vx7sim exits with status 2, having\n"
    "                   played nothing. farms/demo.script is an example.\n"
    "  --help           this text\n"
    "\n"
    "The first line on standard output is \"listening on PORT\". Each connection gets its own\n"
    "address (board 0xFF, instance 1, 2, ...); messages go between connections and boards by\n"
    "target address. A connection that has not sent its open within 5 seconds is closed, and\n"
    "connections not yet open never take the last 64 of the 4096 places. Messages the\n"
    "emulation cannot answer are logged on standard error by type and target.\n"
    "\n"
    "Standard input is a control channel: one command a line, each answered on standard output\n"
    "by one line that starts with \"ok\" or \"error:\". B, T, C are board, trunk and channel.\n"
    "\n"
    "  call B T C FROM         offer an incoming call from number FROM on the channel\n"
    "  hangup B T C            the far end of the channel's call hangs up\n"
    "  alarm B T NAME on|off   raise or clear a line alarm; NAME is red, yellow, ais, los,\n"
    "                          loopback, raicrc or dchan\n"
    "  bpv B T N               N bipolar-violation saturation events on the line\n"
    "  ferr B T N              N frame-error saturation events on the line\n"
    "  line B T in|out [R]     the line goes in or out of service, reason R from 0 to 5\n"
    "  refuse TYPE [CODE]      answer messages of TYPE with MsgError_t of CODE (default 1ff)\n"
    "  silence TYPE            answer messages of TYPE not at all\n"
    "  normal TYPE             answer messages of TYPE normally again\n"
    "  delay MS                hold every answer and event MS milliseconds (0: none)\n"
    "  drop                    close every connection\n"
    "  stats                   counters of messages, answers, events, refusals, connections\n"
    "  help                    the list of commands\n"
    "  quit                    end vx7sim\n"
    "\n"
    "TYPE and CODE are hex (0x optional), everything else decimal. End of input on standard\n"
    "input does not stop vx7sim; quit, SIGINT or SIGTERM do.\n";

sim::RelayServer* g_server = nullptr;

void onSignal(int) {
    if (g_server) {
        g_server->stop();
    }
}

}  // namespace

int main(int argc, char** argv) {
    std::string farmFile;
    std::string scriptFile;
    sim::RelayOptions options;
    for (int i = 1; i < argc; ++i) {
        std::string a = argv[i];
        auto value = [&](const char* what) -> const char* {
            if (i + 1 >= argc) {
                std::cerr << "vx7sim: " << a << " needs " << what << "\n" << kUsage;
                std::exit(2);
            }
            return argv[++i];
        };
        if (a == "--help" || a == "-h") {
            std::cout << kUsage;
            return 0;
        } else if (a == "--farm") {
            farmFile = value("a file");
        } else if (a == "--port") {
            const char* v = value("a port number");
            char* end = nullptr;
            long p = std::strtol(v, &end, 10);
            if (*v == '\0' || *end != '\0' || p < 0 || p > 65535) {
                std::cerr << "vx7sim: not a port number: " << v << "\n";
                return 2;
            }
            options.port = static_cast<int>(p);
        } else if (a == "--max-queued") {
            const char* v = value("a size in MiB");
            char* end = nullptr;
            long m = std::strtol(v, &end, 10);
            if (*v == '\0' || *end != '\0' || m < 1 || m > 1L << 20) {
                std::cerr << "vx7sim: not a size in MiB: " << v << "\n";
                return 2;
            }
            options.maxQueuedOutput = static_cast<std::size_t>(m) << 20;
        } else if (a == "--script") {
            scriptFile = value("a file");
        } else if (a == "--trace") {
            options.trace = true;
        } else if (a == "--bind") {
            options.bindAddress = value("an address");
        } else {
            std::cerr << "vx7sim: unknown argument " << a << "\n" << kUsage;
            return 2;
        }
    }

    std::shared_ptr<const farm::Farm> farm;
    if (!farmFile.empty()) {
        std::string error;
        auto f = farm::loadFarmFile(farmFile, error);
        if (!f) {
            std::cerr << error << std::endl;
            return 1;
        }
        farm = std::make_shared<const farm::Farm>(std::move(*f));
    } else {
        farm::FarmLoad load = farm::activeFarm();
        if (!load.farm) {
            return 1;  // activeFarm has written its one line
        }
        farm = load.farm;
    }

    std::vector<sim::ScriptStep> script;
    if (!scriptFile.empty()) {
        std::ifstream in(scriptFile, std::ios::binary);
        std::ostringstream text;
        text << in.rdbuf();
        if (!in) {
            std::cerr << "vx7sim: cannot read the script " << scriptFile << std::endl;
            return 2;
        }
        sim::ScriptParse parsed = sim::parseScript(text.str());
        if (!parsed.ok) {
            std::cerr << "vx7sim: " << scriptFile << ": " << parsed.error << "; nothing played"
                      << std::endl;
            return 2;
        }
        script = std::move(parsed.steps);
    }

    sim::RelayServer server(farm, options, std::cerr);
    server.setScript(std::move(script));
    std::string error;
    if (!server.listen(error)) {
        std::cerr << "vx7sim: " << error << std::endl;
        return 1;
    }
    std::signal(SIGPIPE, SIG_IGN);
    g_server = &server;
    std::signal(SIGINT, onSignal);
    std::signal(SIGTERM, onSignal);
    std::cout << "listening on " << server.port() << std::endl;
    server.run(STDIN_FILENO, &std::cout);
    g_server = nullptr;
    return 0;
}
