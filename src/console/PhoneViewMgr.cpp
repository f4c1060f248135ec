#include "console/PhoneViewMgr.h"

#include <cstdio>
#include <iostream>
#include <stdexcept>

#include "console/ConsoleLayout.h"
#include "console/DisplayGuard.h"
#include "console/PhoneView.h"
#include "console/View.h"
#include "framework/Exception.h"

namespace lineprobe {

PhoneViewMgr* PhoneViewMgr::_instance = nullptr;

PhoneViewMgr* PhoneViewMgr::CreatePhoneViewMgr(View* view) {
    if (_instance == nullptr) {
        _instance = new PhoneViewMgr(view);
    }
    return _instance;
}

PhoneViewMgr::PhoneViewMgr(View* v) : systemView(new vx7diag::SystemView()) {
    boards = systemView->GetActiveBoardList();
    view = v;
    MakeRows();
}

PhoneViewMgr::PhoneViewMgr(View* v, std::map<unsigned int, vx7diag::BoardManager*> b)
    : boards(std::move(b)), view(v) {
    MakeRows();
}

void PhoneViewMgr::MakeRows() {
    std::cout << " PhoneViewMgr::PhoneViewMgr - Creating PhoneViewMgr instance" << std::endl;
    const int rowCount = view != nullptr ? view->GetRowCount() : 0;
    std::cout << " PhoneViewMgr::PhoneViewMgr - Creating list of Rows" << std::endl;
    rows.assign(static_cast<std::size_t>(rowCount) + 1, nullptr);
    for (int row = 1; row <= rowCount; ++row) {
        rows[static_cast<std::size_t>(row)] = new RowInfo(row, 1);
    }
    if (view == nullptr) {
        return;
    }
    DisplayGuard guard;
    view->SetReverseVideo();
    view->PrintString("B.L.C", 0, headStartingCol);
    view->PrintString("CallId", 0, CALLID_START_COL);
    view->PrintString("ChanState", 0, CHAN_STATE_START_COL);
    view->PrintString("CallState", 0, CALL_STATE_START_COL);
    view->PrintString("Reason", 0, REASON_START_COL);
    view->SetNormalVideo();
}

PhoneViewMgr::~PhoneViewMgr() {
    for (RowInfo* row : rows) {
        delete row;
    }
    delete systemView;
}

std::string PhoneViewMgr::MakeKey(unsigned int board, unsigned int line, unsigned int chan) {
    char key[3 * 12 + 3];
    std::snprintf(key, sizeof key, "%d.%d.%d", static_cast<int>(board), static_cast<int>(line),
                  static_cast<int>(chan));
    return key;
}

PhoneView* PhoneViewMgr::CreatePhoneView(unsigned int board, unsigned int line, unsigned int chan,
                                         int& result) {
    std::cout << "PhoneViewMgr::CreatePhoneView - start.  Board: " << static_cast<int>(board)
              << " line: " << static_cast<int>(line) << " chan: " << static_cast<int>(chan)
              << std::endl;
    const std::string key = MakeKey(board, line, chan);
    if (views.size() >= MAX_PHONE_VIEWS) {
        std::cout << "PhoneViewMgr::CreatePhoneView -Max Phone views already created" << std::endl;
        result = PHONEVIEWMGR_MAX_VIEWS_ALREADY_CREATED;
        return nullptr;
    }
    if (const auto found = views.find(key); found != views.end()) {
        std::cout << "PhoneViewMgr::CreatePhoneView - no need to create PhoneView - already created"
                  << std::endl;
        result = PHONEVIEWMGR_VIEW_ALREADY_CREATED;
        return found->second.first;
    }

    RowInfo* rowInfo = nullptr;
    try {
        std::cout << "PhoneViewMgr::CreatePhoneView - initializinga RowInf list" << std::endl;
        for (RowInfo* candidate : rows) {
            if (candidate != nullptr && candidate->IsAvailable()) {
                rowInfo = candidate;
                break;
            }
        }
        if (rowInfo == nullptr) {
            throw std::runtime_error("no free row in the phone views window");
        }
        rowInfo->InUse();
        const int row = rowInfo->GetRow();
        const int col = rowInfo->GetStartingCol();
        std::cout << "PhoneViewMgr::CreatePhoneView - creating PhoneView instance.  Row: " << row
                  << " StartingCol: " << col << std::endl;

        const auto manager = boards.find(board);
        if (manager == boards.end() || manager->second == nullptr) {
            throw std::out_of_range("no board " + std::to_string(static_cast<int>(board)));
        }
        auto* phoneView = new PhoneView(manager->second, static_cast<int>(board),
                                        static_cast<int>(line), static_cast<int>(chan), row, col);

        std::cout << "PhoneViewMgr::CreatePhoneView - setting view window for new Phone View"
                  << std::endl;
        phoneView->SetView(view);
        std::cout << "PhoneViewMgr::CreatePhoneView - adding newly-create PhoneView to Map"
                  << std::endl;
        views[key] = std::make_pair(phoneView, rowInfo);
        result = PHONEVIEWMGR_SUCCESS;
        return phoneView;
    } catch (const std::exception& e) {
        std::cout << "PhoneViewMgr::CreatePhoneView - got an exception" << std::endl;
        std::cerr << "unable to create phone view " << key << ": " << e.what() << std::endl;
    } catch (const tolk::Exception& e) {
        std::cout << "PhoneViewMgr::CreatePhoneView - got an exception" << std::endl;
        std::cerr << "unable to create phone view " << key << ": " << e << std::endl;
    } catch (...) {
        std::cout << "PhoneViewMgr::CreatePhoneView - got an exception" << std::endl;
        std::cerr << "unable to create phone view " << key << std::endl;
    }
    // A failed creation gives its row back, so that failures never use the rows up.
    if (rowInfo != nullptr) {
        rowInfo->Available();
    }
    result = PHONEVIEWMGR_ERROR;
    return nullptr;
}

int PhoneViewMgr::DestroyPhoneView(unsigned int board, unsigned int line, unsigned int chan) {
    try {
        std::cout << "PhoneViewMgr::DestroyPhoneView - start.  Board: " << static_cast<int>(board)
                  << " line: " << static_cast<int>(line) << " chan: " << static_cast<int>(chan)
                  << std::endl;
        PhoneView* phoneView = FindPhoneView(board, line, chan);
        if (phoneView != nullptr) {
            std::cout << "PhoneViewMgr::DestroyPhoneview - stopping PhoneView" << std::endl;
            phoneView->Stop();
        }
        const auto found = views.find(MakeKey(board, line, chan));
        if (found == views.end()) {
            return PHONEVIEWMGR_ERROR;
        }
        std::cout << "PhoneViewMgr::DestroyPhoneview - getting RowInfo for Phone View" << std::endl;
        RowInfo* rowInfo = found->second.second;
        std::cout << "PhoneViewMgr::DestroyPhoneview - Marking row as available for use"
                  << std::endl;
        rowInfo->Available();
        std::cout << "PhoneViewMgr::DestroyPhoneview - Clearing row" << std::endl;
        if (view != nullptr) {
            view->ClearToEOL(rowInfo->GetRow(), rowInfo->GetStartingCol());
        }
        views.erase(found);
        // Stopped and detached: no event thread can reach its objects any more.
        delete phoneView;
        return PHONEVIEWMGR_SUCCESS;
    } catch (...) {
        std::cout << "PhoneViewManager::DescroyPhoneView - Exception occurred" << std::endl;
        return PHONEVIEWMGR_ERROR;
    }
}

int PhoneViewMgr::DestroyAllPhoneViews() {
    try {
        // The views are left allocated: at shutdown the main thread may still be inside a
        // command that uses one.
        for (auto it = views.begin(); it != views.end();) {
            it->second.first->Stop();
            it = views.erase(it);
        }
        return 1;
    } catch (...) {
        std::cout << "error destroying all phone views" << std::endl;
        return 0;
    }
}

PhoneView* PhoneViewMgr::FindPhoneView(unsigned int board, unsigned int line, unsigned int chan) {
    const auto found = views.find(MakeKey(board, line, chan));
    return found == views.end() ? nullptr : found->second.first;
}

void PhoneViewMgr::SetView(View* v) {
    view = v;
}

View* PhoneViewMgr::GetView() {
    return view;
}

}  // namespace lineprobe
