#pragma once

#include <map>
#include <string>
#include <utility>
#include <vector>

#include "console/RowInfo.h"
#include "model/SystemView.h"

namespace vx7diag {
class BoardManager;
}

namespace lineprobe {

class PhoneView;
class View;

constexpr int PHONEVIEWMGR_SUCCESS = 0;
constexpr int PHONEVIEWMGR_VIEW_ALREADY_CREATED = 1;
constexpr int PHONEVIEWMGR_ERROR_CREATING_VIEW = -1;
constexpr int PHONEVIEWMGR_MAX_VIEWS_ALREADY_CREATED = -2;
constexpr int PHONEVIEWMGR_ERROR = -3;

constexpr unsigned int MAX_PHONE_VIEWS = 10;

// The phone views window: hands out its rows and keeps the open views by "board.line.chan".
// Used on the main thread, and at shutdown by the signal handler.
class PhoneViewMgr {
  public:
    static PhoneViewMgr* CreatePhoneViewMgr(View* view);
    // The process's manager is never destroyed; one made for a test frees its rows.
    virtual ~PhoneViewMgr();
    PhoneViewMgr(const PhoneViewMgr&) = delete;
    PhoneViewMgr& operator=(const PhoneViewMgr&) = delete;

    PhoneView* CreatePhoneView(unsigned int board, unsigned int line, unsigned int chan,
                               int& result);
    int DestroyPhoneView(unsigned int board, unsigned int line, unsigned int chan);
    // Stops every view; for the end of the process, so rows stay as they are. 1, or 0
    // when a view failed to stop.
    int DestroyAllPhoneViews();
    PhoneView* FindPhoneView(unsigned int board, unsigned int line, unsigned int chan);

    void SetView(View* view);
    View* GetView();

    // "board.line.chan" with each number as a signed decimal.
    static std::string MakeKey(unsigned int board, unsigned int line, unsigned int chan);
    std::size_t ViewCount() const { return views.size(); }

  protected:
    // For tests: a manager on a window of its own, with the given boards.
    PhoneViewMgr(View* view, std::map<unsigned int, vx7diag::BoardManager*> boards);

  private:
    explicit PhoneViewMgr(View* view);
    void MakeRows();

    static PhoneViewMgr* _instance;

    int headStartingCol = 1;
    vx7diag::SystemView* systemView = nullptr;
    std::map<unsigned int, vx7diag::BoardManager*> boards;
    View* view = nullptr;
    std::vector<RowInfo*> rows;
    std::map<std::string, std::pair<PhoneView*, RowInfo*>> views;
};

}  // namespace lineprobe
