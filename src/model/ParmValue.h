#pragma once

#include "catalogue/stdresource/StdResource.h"
#include "model/Guarded.h"

namespace vx7diag {

// The value of one parameter of a component, read by a blocking request.
inline unsigned int ParmValue(tolk::StdResource& resource, unsigned int parm) {
    tolk::StdResource::MsgGetParmCmplt_t answer;
    Captured([&] { resource.GetParm(parm, &answer); });
    return *answer.pVal;
}

}  // namespace vx7diag
