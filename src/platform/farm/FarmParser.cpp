#include "platform/farm/FarmParser.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <toml++/toml.h>
#include <cerrno>
#include <cstring>
#include <exception>
#include <initializer_list>
#include <map>

namespace farm {

namespace {

struct FarmFault {
    toml::source_position where;
    std::string what;
};

[[noreturn]] void fail(const toml::source_region& at, std::string what) {
    throw FarmFault{at.begin, std::move(what)};
}

std::string quoted(std::string_view s) {
    std::string out = "\"";
    for (char c : s) {
        // Control bytes would break the one-line report.
        out += (static_cast<unsigned char>(c) < 0x20) ? '?' : c;
    }
    return out + "\"";
}

void onlyKeys(const toml::table& t, std::initializer_list<std::string_view> allowed) {
    for (auto&& [key, node] : t) {
        bool known = false;
        for (auto a : allowed) {
            known = known || key.str() == a;
        }
        if (!known) {
            fail(key.source(), "unknown key " + quoted(key.str()));
        }
    }
}

const toml::node& required(const toml::table& t, std::string_view key) {
    const toml::node* n = t.get(key);
    if (!n) {
        fail(t.source(), std::string(key) + " is missing");
    }
    return *n;
}

std::int64_t integer(const toml::node& n, std::string_view key, std::int64_t lo, std::int64_t hi,
                     std::string_view why = {}) {
    const auto* v = n.as_integer();
    if (!v) {
        fail(n.source(), std::string(key) + " must be an integer");
    }
    std::int64_t x = v->get();
    if (x < lo || x > hi) {
        std::string msg =
            std::string(key) + " must be " + std::to_string(lo) + " to " + std::to_string(hi);
        if (!why.empty()) {
            msg += " (" + std::string(why) + ")";
        }
        fail(n.source(), msg + ", not " + std::to_string(x));
    }
    return x;
}

const std::string& text(const toml::node& n, std::string_view key) {
    const auto* v = n.as_string();
    if (!v) {
        fail(n.source(), std::string(key) + " must be a string");
    }
    const std::string& s = v->get();
    if (s.empty() || s.size() > kMaxTextLength) {
        fail(n.source(),
             std::string(key) + " must be 1 to " + std::to_string(kMaxTextLength) + " characters");
    }
    if (s.find('\0') != std::string::npos) {
        fail(n.source(), std::string(key) + " must not contain a NUL character");
    }
    return s;
}

const toml::array& tableArray(const toml::node& n, std::string_view key, std::string_view header) {
    const auto* a = n.as_array();
    if (!a || !a->is_array_of_tables()) {
        fail(n.source(),
             std::string(key) + " must be an array of tables ([[" + std::string(header) + "]])");
    }
    return *a;
}

class Reader {
  public:
    Farm read(const toml::table& root) {
        onlyKeys(root, {"system_name", "board"});
        farm_.systemName = text(required(root, "system_name"), "system_name");
        if (const toml::node* boards = root.get("board")) {
            const auto& list = tableArray(*boards, "board", "board");
            for (const auto& b : list) {
                readBoard(*b.as_table());
            }
        }
        return std::move(farm_);
    }

  private:
    void readBoard(const toml::table& t) {
        onlyKeys(t, {"logical_id", "name", "serial", "routing", "media", "trunk"});
        Board b;
        const toml::node& idNode = required(t, "logical_id");
        b.logicalId = static_cast<unsigned>(integer(idNode, "logical_id", 0, kMaxLogicalId));
        if (auto it = boardLines_.find(b.logicalId); it != boardLines_.end()) {
            fail(idNode.source(), "logical_id " + std::to_string(b.logicalId) +
                                      " is already used by the board at line " +
                                      std::to_string(it->second));
        }
        boardLines_[b.logicalId] = t.source().begin.line;
        b.name = text(required(t, "name"), "name");
        b.serial = text(required(t, "serial"), "serial");

        if (const toml::node* r = t.get("routing")) {
            const auto* s = r->as_string();
            if (s && s->get() == "fixed") {
                b.routing = Routing::Fixed;
            } else if (s && s->get() == "flexible") {
                b.routing = Routing::Flexible;
            } else {
                fail(r->source(), "routing must be \"fixed\" or \"flexible\"" +
                                      (s ? ", not " + quoted(s->get()) : std::string()));
            }
        }
        readMedia(t, b);

        if (const toml::node* trunks = t.get("trunk")) {
            const auto& list = tableArray(*trunks, "trunk", "board.trunk");
            if (list.size() > static_cast<std::size_t>(kMaxTrunks)) {
                fail(list[kMaxTrunks].source(),
                     "a board has at most " + std::to_string(kMaxTrunks) + " trunks");
            }
            for (const auto& tr : list) {
                readTrunk(*tr.as_table(), b);
            }
        }
        if (b.voiceChannelCount() > kMaxVoiceChannels) {
            fail(t.source(), "a flexible-routing board serves at most " +
                                 std::to_string(kMaxVoiceChannels) + " channels, this one has " +
                                 std::to_string(b.voiceChannelCount()));
        }
        farm_.boards.push_back(std::move(b));
    }

    static void readMedia(const toml::table& t, Board& b) {
        const toml::node* m = t.get("media");
        if (!m) {
            if (b.flexible()) {
                b.media.assign(std::begin(kAllMedia), std::end(kAllMedia));
            }
            return;
        }
        if (!b.flexible()) {
            fail(m->source(), "media needs routing = \"flexible\"");
        }
        const auto* list = m->as_array();
        if (!list) {
            fail(m->source(), "media must be a list of names");
        }
        bool seen[std::size(kAllMedia)] = {};
        for (const auto& item : *list) {
            const auto* s = item.as_string();
            std::optional<Media> media = s ? mediaFromName(s->get()) : std::nullopt;
            if (!media) {
                fail(item.source(),
                     "media must name SIGDET, SIGBUF_DTMF, SIGBUF_MF, TONEGEN, CALLANALYSIS, "
                     "R2MFP or CALLERID" +
                         (s ? ", not " + quoted(s->get()) : std::string()));
            }
            // value(), not *: fail() does not return, but the optimizer of a sanitizer build
            // cannot always see that and would warn of an unset value.
            const Media named = media.value();
            auto i = static_cast<std::size_t>(named);
            if (seen[i]) {
                fail(item.source(), "media lists " + std::string(mediaName(named)) + " twice");
            }
            seen[i] = true;
        }
        // Kept in the device map's order whatever the file's order.
        for (Media x : kAllMedia) {
            if (seen[static_cast<std::size_t>(x)]) {
                b.media.push_back(x);
            }
        }
    }

    void readTrunk(const toml::table& t, Board& b) {
        onlyKeys(t, {"channels", "type", "signaling", "first_number"});
        Trunk tr;
        tr.number = static_cast<int>(b.trunks.size()) + 1;
        const toml::node& typeNode = required(t, "type");
        tr.type = static_cast<int>(
            integer(typeNode, "type", 0, kAnalogTrunkType, "below 4 digital, 4 analog"));
        if (!b.trunks.empty() && b.trunks.front().analog() != tr.analog()) {
            fail(typeNode.source(), "a board's trunks are all analog (type 4) or all digital");
        }

        const toml::node* channels = t.get("channels");
        const toml::node* signaling = t.get("signaling");
        if (tr.analog()) {
            tr.channels = kAnalogChannels;
            if (channels && channels->as_integer() &&
                channels->as_integer()->get() != kAnalogChannels) {
                fail(channels->source(), "an analog trunk (type 4) has 4 channels, not " +
                                             std::to_string(channels->as_integer()->get()));
            }
            if (channels) {
                integer(*channels, "channels", kAnalogChannels, kAnalogChannels);
            }
            tr.signaling = Signaling::CAS;
            if (signaling) {
                if (!signaling->as_string() || signaling->as_string()->get() != "CAS") {
                    fail(signaling->source(),
                         "an analog trunk (type 4) uses CAS signaling" +
                             (signaling->as_string()
                                  ? ", not " + quoted(signaling->as_string()->get())
                                  : std::string()));
                }
            }
        } else {
            if (!channels) {
                fail(t.source(), "channels is missing");
            }
            tr.channels = static_cast<int>(integer(*channels, "channels", 1, kMaxChannels));
            if (!signaling) {
                fail(t.source(), "signaling is missing");
            }
            tr.signaling = readSignaling(*signaling);
        }

        if (const toml::node* first = t.get("first_number")) {
            readNumbers(*first, b, tr);
        }
        b.trunks.push_back(std::move(tr));
    }

    static Signaling readSignaling(const toml::node& n) {
        const auto* s = n.as_string();
        if (s && s->get() == "CAS") {
            return Signaling::CAS;
        }
        if (s && s->get() == "CCS") {
            return Signaling::CCS;
        }
        if (s && s->get() == "CLEAR") {
            return Signaling::CLEAR;
        }
        fail(n.source(), "signaling must be \"CAS\", \"CCS\" or \"CLEAR\"" +
                             (s ? ", not " + quoted(s->get()) : std::string()));
    }

    void readNumbers(const toml::node& n, const Board& b, Trunk& tr) {
        const auto* s = n.as_string();
        if (!s) {
            fail(n.source(), "first_number must be a string of digits");
        }
        const std::string& first = s->get();
        bool digits = !first.empty() && first.size() <= 31;
        for (char c : first) {
            digits = digits && c >= '0' && c <= '9';
        }
        if (!digits) {
            fail(n.source(), "first_number must be 1 to 31 digits, not " + quoted(first));
        }
        if (addToNumber(first, tr.channels - 1).empty()) {
            fail(n.source(), "first_number " + first + " leaves no room for " +
                                 std::to_string(tr.channels) + " channels of " +
                                 std::to_string(first.size()) + " digits");
        }
        for (int c = 1; c <= tr.channels; ++c) {
            std::string number = addToNumber(first, c - 1);
            ChannelRef here{b.logicalId, tr.number, c};
            auto [it, fresh] = farm_.numbers.emplace(number, here);
            if (!fresh) {
                const ChannelRef& other = it->second;
                fail(n.source(), "number " + number + " of channel " + name(here) +
                                     " is already channel " + name(other));
            }
        }
        tr.firstNumber = first;
    }

    static std::string name(const ChannelRef& c) {
        return std::to_string(c.board) + "." + std::to_string(c.trunk) + "." +
               std::to_string(c.channel);
    }

    Farm farm_;
    std::map<unsigned, std::uint32_t> boardLines_;
};

std::string where(std::string_view source, const toml::source_position& p) {
    return std::string(source) + ":" + std::to_string(p.line) + ":" + std::to_string(p.column) +
           ": ";
}

std::string oneLine(std::string_view s) {
    std::string out(s);
    for (char& c : out) {
        if (c == '\n' || c == '\r') {
            c = ' ';
        }
    }
    return out;
}

}  // namespace

std::optional<Farm> parseFarm(std::string_view text, std::string_view source, std::string& error) {
    try {
        toml::table root = toml::parse(text, source);
        return Reader{}.read(root);
    } catch (const toml::parse_error& e) {
        error = where(source, e.source().begin) + oneLine(e.description());
    } catch (const FarmFault& f) {
        error = where(source, f.where) + f.what;
    } catch (const std::exception& e) {
        error = std::string(source) + ": " + oneLine(e.what());
    }
    return std::nullopt;
}

std::optional<Farm> loadFarmFile(const std::string& path, std::string& error) {
    auto refuse = [&](const std::string& why) {
        error = path + ": cannot read the farm file: " + why;
        return std::nullopt;
    };
    int fd = ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) {
        return refuse(std::strerror(errno));
    }
    struct stat st {};
    std::string content;
    bool ok = ::fstat(fd, &st) == 0;
    std::string why = ok ? "" : std::strerror(errno);
    if (ok && !S_ISREG(st.st_mode)) {
        ok = false;
        why = "not a regular file";
    } else if (ok && static_cast<std::size_t>(st.st_size) > kMaxFarmFileBytes) {
        ok = false;
        why = "larger than " + std::to_string(kMaxFarmFileBytes) + " bytes";
    }
    if (ok) {
        content.resize(static_cast<std::size_t>(st.st_size));
        std::size_t got = 0;
        while (got < content.size()) {
            ssize_t n = ::read(fd, content.data() + got, content.size() - got);
            if (n < 0 && errno == EINTR) {
                continue;
            }
            if (n <= 0) {
                ok = n == 0;
                why = n < 0 ? std::strerror(errno) : "";
                break;
            }
            got += static_cast<std::size_t>(n);
        }
        content.resize(got);
    }
    ::close(fd);
    if (!ok) {
        return refuse(why);
    }
    return parseFarm(content, path, error);
}

}  // namespace farm
