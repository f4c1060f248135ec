#include "model/VX7EventZLGLogger.h"

#include <iostream>

#include "model/Aspect.h"
#include "platform/zlg/zlg.h"

namespace vx7diag {

VX7EventZLGLogger::VX7EventZLGLogger() {
    ZLG_HANDLE handle = 0;
    int result = ZlgGetModuleHandle("Ocelot", &handle);
    if (result != 0) {
        ZlgTraceMessageVarg("Unable to retrieve module handle, ZlgRet = %d", result);
    } else {
        moduleHandle = handle;
    }
    handle = 0;
    result = ZlgGetLabelHandle("Error", &handle);
    if (result != 0) {
        ZlgTraceMessageVarg("Unable to retrieve label handle, ZlgRet = %d", result);
    } else {
        labelHandle = handle;
    }
}

VX7EventZLGLogger::~VX7EventZLGLogger() = default;

void VX7EventZLGLogger::Update(Subject*, Aspect& aspect) {
    isa::AutoCriticalSection guard(lock);
    const char* text = aspect.ToZLG();
    // An aspect without text (never a publication during an event) is traced as an empty line
    // rather than handed to the library as null.
    if (text == nullptr) {
        text = "";
    }
    std::cout << "trace:: " << text << std::endl;
    ZlgTraceNoClient(moduleHandle, labelHandle, aspect.ToZLG() != nullptr ? aspect.ToZLG() : "");
}

}  // namespace vx7diag
