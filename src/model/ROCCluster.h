#pragma once

#include <memory>

#include "catalogue/cluster/Cluster.h"
#include "catalogue/tsc/TSC.h"
#include "framework/staticList.h"

namespace vx7diag {

using MediaList = tolk::staticList<tolk::TSC::MsgAttach_t::MediaInfo_t>;

// One voice resource group of a flexible-routing board: the ROC cluster and the media components
// in it, as a TSC attach wants them.
class ROCCluster {
  public:
    // Takes the cluster over.
    ROCCluster(tolk::Cluster* cluster, unsigned char count, const MediaList& list);
    ROCCluster(const ROCCluster&) = delete;
    ROCCluster& operator=(const ROCCluster&) = delete;
    ~ROCCluster();

    MediaList GetMediaDescriptors() const;
    tolk::Cluster* GetCluster() const;
    unsigned char GetMediaCount() const { return mediaCount; }
    void DebugPrint() const;

  private:
    unsigned char mediaCount;
    MediaList mediaList;
    std::unique_ptr<tolk::Cluster> cluster;
};

}  // namespace vx7diag
