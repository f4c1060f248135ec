#include "platform/unitmap/unitmap.h"

#include <memory>
#include <mutex>

#include "platform/farm/ActiveFarm.h"
#include "platform/unitmap/AuTree.h"

namespace {

std::mutex g_lock;
std::shared_ptr<const farm::Farm> g_builtFrom;
std::shared_ptr<const unitmap::AuTree> g_tree;

// The tree of the active farm, rebuilt when the farm has been reloaded; null when the farm
// cannot be read, which is how the board service being down looks to callers.
std::shared_ptr<const unitmap::AuTree> tree() {
    farm::FarmLoad load = farm::activeFarm();
    std::lock_guard<std::mutex> guard(g_lock);
    if (!load.farm) {
        g_builtFrom.reset();
        g_tree.reset();
        return nullptr;
    }
    if (load.farm != g_builtFrom) {
        g_tree = std::make_shared<const unitmap::AuTree>(*load.farm);
        g_builtFrom = load.farm;
    }
    return g_tree;
}

bool validSearch(uint32_t n, const um_attribute* attributes) {
    if (n > 0 && !attributes) {
        return false;
    }
    for (uint32_t i = 0; i < n; ++i) {
        if (!attributes[i].name || !attributes[i].value) {
            return false;
        }
    }
    return true;
}

}  // namespace

extern "C" int um_getHostAU(UM_AUID* hostAU) {
    if (!hostAU) {
        return UM_ERR_INVALID_ARGUMENT;
    }
    auto t = tree();
    if (!t) {
        return UM_ERR_SERVICE_DOWN;
    }
    *hostAU = t->host();
    return UM_SUCCESS;
}

extern "C" int um_findAUs(UM_AUID parent, uint32_t numAttributes, um_attribute* attributes,
                          uint32_t* count, UM_AUID* result) {
    if (!count || (*count > 0 && !result) || !validSearch(numAttributes, attributes)) {
        return UM_ERR_INVALID_ARGUMENT;
    }
    auto t = tree();
    if (!t) {
        return UM_ERR_SERVICE_DOWN;
    }
    if (!t->find(parent)) {
        return UM_ERR_INVALID_AU;
    }
    const uint32_t room = *count;
    uint32_t found = 0;
    for (const unitmap::Au* au : t->below(parent)) {
        if (found == room) {
            break;
        }
        bool all = true;
        for (uint32_t i = 0; i < numAttributes && all; ++i) {
            all = unitmap::matches(*au, attributes[i]);
        }
        if (all) {
            result[found++] = au->handle;
        }
    }
    *count = found;
    return UM_SUCCESS;
}

extern "C" int um_getAttributes(UM_AUID au, uint32_t numAttributes, um_attribute* attributes) {
    if (numAttributes == 0 || !attributes) {
        return UM_ERR_INVALID_ARGUMENT;
    }
    auto t = tree();
    const unitmap::Au* node = t ? t->find(au) : nullptr;
    uint32_t failure = t ? UM_ERR_INVALID_AU : UM_ERR_SERVICE_DOWN;
    if (!node) {
        for (uint32_t i = 0; i < numAttributes; ++i) {
            attributes[i].status = failure;
        }
        return static_cast<int>(failure);
    }
    uint32_t succeeded = 0;
    for (uint32_t i = 0; i < numAttributes; ++i) {
        if (unitmap::readAttribute(*node, attributes[i]) == UM_SUCCESS) {
            ++succeeded;
        }
    }
    if (succeeded == numAttributes) {
        return UM_SUCCESS;
    }
    return succeeded > 0 ? UM_PARTIAL : static_cast<int>(attributes[0].status);
}

extern "C" int um_initAttributeStruct(um_attribute* attribute, const char* name, void* value,
                                      uint32_t size, uint32_t status, uint32_t reserved) {
    if (!attribute) {
        return UM_ERR_INVALID_ARGUMENT;
    }
    attribute->name = name;
    attribute->value = value;
    attribute->size = size;
    attribute->status = status;
    attribute->reserved = reserved;
    return UM_SUCCESS;
}
