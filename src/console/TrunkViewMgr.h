#pragma once

#include <map>
#include <string>
#include <utility>
#include <vector>

#include "console/RowInfo.h"

namespace lineprobe {

class TrunkView;
class View;

constexpr int TRUNKVIEWMGR_SUCCESS = 0;
constexpr int TRUNKVIEWMGR_VIEW_ALREADY_CREATED = 1;
constexpr int TRUNKVIEWMGR_ERROR_CREATING_VIEW = -1;
constexpr int TRUNKVIEWMGR_MAX_VIEWS_ALREADY_CREATED = -2;
constexpr int TRUNKVIEWMGR_ERROR = -3;

constexpr unsigned int MAX_TRUNK_VIEWS = 10;

// The trunk views window: hands out its rows and keeps the open views by "board.line".
// Used on the main thread, and at shutdown by the signal handler. A trunk finds its board
// by number, so this manager needs no board list.
class TrunkViewMgr {
  public:
    static TrunkViewMgr* CreateTrunkViewMgr(View* view);
    // The process's manager is never destroyed; one made for a test frees its rows.
    virtual ~TrunkViewMgr();
    TrunkViewMgr(const TrunkViewMgr&) = delete;
    TrunkViewMgr& operator=(const TrunkViewMgr&) = delete;

    TrunkView* CreateTrunkView(unsigned int board, unsigned int line, int& result);
    int DestroyTrunkView(unsigned int board, unsigned int line);
    // Stops every view; for the end of the process, so rows stay as they are. 1, or 0
    // when a view failed to stop.
    int DestroyAllTrunkViews();
    TrunkView* FindTrunkView(unsigned int board, unsigned int line);

    void SetView(View* view);
    View* GetView();

    // "board.line" with each number as a signed decimal.
    static std::string MakeKey(unsigned int board, unsigned int line);
    std::size_t ViewCount() const { return views.size(); }

  protected:
    // Also for tests: a manager on a window of its own.
    explicit TrunkViewMgr(View* view);

  private:
    static TrunkViewMgr* _instance;

    int headStartingCol = 1;
    View* view = nullptr;
    std::vector<RowInfo*> rows;
    std::map<std::string, std::pair<TrunkView*, RowInfo*>> views;
};

}  // namespace lineprobe
