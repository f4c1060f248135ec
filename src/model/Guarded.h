#pragma once

#include <exception>
#include <optional>
#include <ostream>
#include <sstream>
#include <stdexcept>
#include <string>

#include "framework/Addressable.h"
#include "framework/Exception.h"
#include "framework/Msg.h"
#include "transport/TKSCommon.h"

namespace vx7diag {

// What a board's refusal or silence becomes when it leaves a model object: the framework's own
// exceptions point at the proxy that made the request, which may be gone by the time anyone
// prints them, so the text is taken while that proxy still exists.
class BoardFailure : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

// Runs one request whose proxy dies with the caller's scope; a framework exception comes out as
// a BoardFailure carrying its text.
template <class Work>
decltype(auto) Captured(Work&& work) {
    try {
        return work();
    } catch (const tolk::Exception& e) {
        std::ostringstream text;
        text << e;
        throw BoardFailure(text.str());
    }
}

// Runs one search for which the board's refusal (a MsgError_t in place of the result) is an
// answer: there is nothing to find. That gives an empty result; silence or any other reply is a
// failure and comes out as Captured makes it.
template <class Work>
auto FoundOrRefused(Work&& work) -> std::optional<decltype(work())> {
    return Captured([&]() -> std::optional<decltype(work())> {
        try {
            return work();
        } catch (const tolk::Addressable::UnexpectedMsg& e) {
            const tolk::Msg* reply = e.getMsg();
            if (reply != nullptr && reply->getMsgType() == 0) {
                return std::nullopt;
            }
            throw;
        }
    });
}

// Runs `work`; an exception that a board's answer, silence or absence can raise is written to
// `log` after `what`, and the result is false. Both exception roots are caught: the framework's
// and the transport's are unrelated.
template <class Work>
bool RunGuarded(std::ostream& log, const char* what, Work&& work) {
    try {
        work();
        return true;
    } catch (const tolk::Exception& e) {
        log << what << e << std::endl;
    } catch (const TKSException&) {
        log << what << "transport failure" << std::endl;
    } catch (const std::exception& e) {
        log << what << e.what() << std::endl;
    }
    return false;
}

}  // namespace vx7diag
