#include "model/ROCCluster.h"

#include <iostream>

namespace vx7diag {

ROCCluster::ROCCluster(tolk::Cluster* c, unsigned char count, const MediaList& list)
    : mediaCount(count), mediaList(list), cluster(c) {}

ROCCluster::~ROCCluster() = default;

MediaList ROCCluster::GetMediaDescriptors() const {
    return mediaList;
}

tolk::Cluster* ROCCluster::GetCluster() const {
    return cluster.get();
}

void ROCCluster::DebugPrint() const {
    std::cout << mediaList << std::endl;
}

}  // namespace vx7diag
