#include "console/TrunkViewMgr.h"

#include <cstdio>
#include <iostream>
#include <stdexcept>

#include "console/ConsoleLayout.h"
#include "console/DisplayGuard.h"
#include "console/TrunkView.h"
#include "console/View.h"
#include "framework/Exception.h"

namespace lineprobe {

TrunkViewMgr* TrunkViewMgr::_instance = nullptr;

TrunkViewMgr* TrunkViewMgr::CreateTrunkViewMgr(View* view) {
    if (_instance == nullptr) {
        _instance = new TrunkViewMgr(view);
    }
    return _instance;
}

TrunkViewMgr::TrunkViewMgr(View* v) : view(v) {
    std::cout << " TrunkViewMgr::TrunkViewMgr - Creating TrunkViewMgr instance" << std::endl;
    const int rowCount = view != nullptr ? view->GetRowCount() : 0;
    std::cout << " TrunkViewMgr::TrunkViewMgr - Creating list of Rows" << std::endl;
    rows.assign(static_cast<std::size_t>(rowCount) + 1, nullptr);
    for (int row = 1; row <= rowCount; ++row) {
        rows[static_cast<std::size_t>(row)] = new RowInfo(row, 1);
    }
    if (view == nullptr) {
        return;
    }
    DisplayGuard guard;
    view->SetReverseVideo();
    view->PrintString("B.L", 0, headStartingCol);
    view->PrintString("TrunkState", 0, LINESTATE_START_COL);
    view->PrintString("Reason", 0, LINESTATE_REASON_START_COL);
    view->PrintString("Sig", 0, LOS_CFA_START_COL);
    view->PrintString("LBK", 0, LOOPBACK_CFA_START_COL);
    view->PrintString("Red", 0, RED_CFA_START_COL);
    view->PrintString("Yel", 0, YELLOW_CFA_START_COL);
    view->PrintString("CRC", 0, CRC_CFA_START_COL);
    view->PrintString("AIS", 0, AIS_CFA_START_COL);
    view->PrintString("DChan", 0, DCHAN_START_COL);
    view->PrintString("BPVS", 0, BPVS_START_COL);
    view->PrintString("FERR", 0, FERR_START_COL);
    view->SetNormalVideo();
}

TrunkViewMgr::~TrunkViewMgr() {
    for (RowInfo* row : rows) {
        delete row;
    }
}

std::string TrunkViewMgr::MakeKey(unsigned int board, unsigned int line) {
    char key[2 * 12 + 2];
    std::snprintf(key, sizeof key, "%d.%d", static_cast<int>(board), static_cast<int>(line));
    return key;
}

TrunkView* TrunkViewMgr::CreateTrunkView(unsigned int board, unsigned int line, int& result) {
    std::cout << "TrunkViewMgr::CreateTrunkView - start.  Board: " << static_cast<int>(board)
              << " line: " << static_cast<int>(line) << std::endl;
    const std::string key = MakeKey(board, line);
    if (views.size() >= MAX_TRUNK_VIEWS) {
        std::cout << "TrunkViewMgr::CreateTrunkView -Max Phone views already created" << std::endl;
        result = TRUNKVIEWMGR_MAX_VIEWS_ALREADY_CREATED;
        return nullptr;
    }
    if (const auto found = views.find(key); found != views.end()) {
        std::cout << "TrunkViewMgr::CreateTrunkView - no need to create TrunkView - already created"
                  << std::endl;
        result = TRUNKVIEWMGR_VIEW_ALREADY_CREATED;
        return found->second.first;
    }

    RowInfo* rowInfo = nullptr;
    try {
        std::cout << "TrunkViewMgr::CreateTrunkView - initializinga RowInf list" << std::endl;
        for (RowInfo* candidate : rows) {
            if (candidate != nullptr && candidate->IsAvailable()) {
                rowInfo = candidate;
                break;
            }
        }
        if (rowInfo == nullptr) {
            throw std::runtime_error("no free row in the trunk views window");
        }
        rowInfo->InUse();
        const int row = rowInfo->GetRow();
        const int col = rowInfo->GetStartingCol();
        std::cout << "TrunkViewMgr::CreateTrunkView - creating TrunkView instance.  Row: " << row
                  << " StartingCol: " << col << std::endl;
        auto* trunkView = new TrunkView(static_cast<int>(board), static_cast<int>(line), row, col);

        std::cout << "TrunkViewMgr::CreateTrunkView - setting view window for new Phone View"
                  << std::endl;
        trunkView->SetView(view);
        std::cout << "TrunkViewMgr::CreateTrunkView - adding newly-create TrunkView to Map"
                  << std::endl;
        views[key] = std::make_pair(trunkView, rowInfo);
        result = TRUNKVIEWMGR_SUCCESS;
        return trunkView;
    } catch (const std::exception& e) {
        std::cout << "TrunkViewMgr::CreateTrunkView - got an exception" << std::endl;
        std::cerr << "unable to create trunk view " << key << ": " << e.what() << std::endl;
    } catch (const tolk::Exception& e) {
        std::cout << "TrunkViewMgr::CreateTrunkView - got an exception" << std::endl;
        std::cerr << "unable to create trunk view " << key << ": " << e << std::endl;
    } catch (...) {
        std::cout << "TrunkViewMgr::CreateTrunkView - got an exception" << std::endl;
        std::cerr << "unable to create trunk view " << key << std::endl;
    }
    // A failed creation gives its row back, so that failures never use the rows up.
    if (rowInfo != nullptr) {
        rowInfo->Available();
    }
    result = TRUNKVIEWMGR_ERROR;
    return nullptr;
}

int TrunkViewMgr::DestroyTrunkView(unsigned int board, unsigned int line) {
    try {
        std::cout << "TrunkViewMgr::DestroyTrunkView - start.  Board: " << static_cast<int>(board)
                  << " line: " << static_cast<int>(line) << std::endl;
        const auto found = views.find(MakeKey(board, line));
        if (found == views.end()) {
            return TRUNKVIEWMGR_ERROR;
        }
        std::cout << "TrunkViewMgr::DestroyPhoneview - getting Phone View ptr" << std::endl;
        TrunkView* trunkView = found->second.first;
        trunkView->Stop();
        std::cout << "TrunkViewMgr::DestroyPhoneview - getting RowInfo for Phone View" << std::endl;
        RowInfo* rowInfo = found->second.second;
        std::cout << "TrunkViewMgr::DestroyPhoneview - Marking row as available for use"
                  << std::endl;
        rowInfo->Available();
        std::cout << "TrunkViewMgr::DestroyPhoneview - Clearing row" << std::endl;
        if (view != nullptr) {
            view->ClearToEOL(rowInfo->GetRow(), rowInfo->GetStartingCol());
        }
        views.erase(found);
        // Stopped and detached: no event thread can reach its objects any more.
        delete trunkView;
        return TRUNKVIEWMGR_SUCCESS;
    } catch (...) {
        std::cout << "TrunkViewMgr::DescroyTrunkView - Exception occurred" << std::endl;
        return TRUNKVIEWMGR_ERROR;
    }
}

int TrunkViewMgr::DestroyAllTrunkViews() {
    try {
        // The views are left allocated: at shutdown the main thread may still be inside a
        // command that uses one.
        for (auto it = views.begin(); it != views.end();) {
            it->second.first->Stop();
            it = views.erase(it);
        }
        return 1;
    } catch (...) {
        std::cout << "error destroying all trunk views" << std::endl;
        return 0;
    }
}

TrunkView* TrunkViewMgr::FindTrunkView(unsigned int board, unsigned int line) {
    const auto found = views.find(MakeKey(board, line));
    return found == views.end() ? nullptr : found->second.first;
}

void TrunkViewMgr::SetView(View* v) {
    view = v;
}

View* TrunkViewMgr::GetView() {
    return view;
}

}  // namespace lineprobe
