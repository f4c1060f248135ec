#pragma once

#include <exception>
#include <ostream>

#include "framework/Exception.h"
#include "transport/TKSCommon.h"

namespace vx7diag {

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
