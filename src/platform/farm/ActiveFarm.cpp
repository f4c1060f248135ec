#include "platform/farm/ActiveFarm.h"

#include <cstdlib>
#include <iostream>
#include <mutex>
#include <optional>

#include "platform/farm/FarmParser.h"

namespace farm {

namespace {

std::mutex g_lock;
std::optional<FarmLoad> g_loaded;

FarmLoad load() {
    FarmLoad result;
    const char* path = std::getenv(kFarmEnvironment);
    std::optional<Farm> f;
    if (path && *path) {
        result.source = path;
        f = loadFarmFile(path, result.error);
    } else {
        result.source = kBuiltinFarmSource;
        f = parseFarm(builtinFarmText(), kBuiltinFarmSource, result.error);
    }
    if (f) {
        result.farm = std::make_shared<const Farm>(std::move(*f));
        result.error.clear();
    } else {
        std::cerr << result.error << std::endl;
    }
    return result;
}

}  // namespace

FarmLoad activeFarm() {
    std::lock_guard<std::mutex> guard(g_lock);
    if (!g_loaded) {
        g_loaded = load();
    }
    return *g_loaded;
}

void resetActiveFarm() {
    std::lock_guard<std::mutex> guard(g_lock);
    g_loaded.reset();
}

}  // namespace farm
