#pragma once

// Screen layout, fixed at compile time for a terminal of at least MIN_ROWS by MIN_COLS.
// Window rows and columns count from 0 inside their window; STARTING values are screen
// positions.
namespace lineprobe {

constexpr int MIN_ROWS = 40;
constexpr int MIN_COLS = 100;
constexpr int STARTING_COL = 0;
constexpr int FIELD_SEPERATOR_LENGTH = 3;

constexpr int SYSVIEW_STARTING_ROW = 0;
constexpr int SYSVIEW_STARTING_COL = 1;
constexpr int SYSVIEW_WINDOW_HEIGHT = 10;
constexpr int SYSVIEW_WINDOW_WIDTH = 100;

constexpr int PHONEVIEWS_WINDOW_STARTING_ROW = 12;
constexpr int PHONEVIEWS_WINDOW_STARTING_COL = 1;
constexpr int PHONEVIEWS_WINDOW_HEIGHT = 10;
constexpr int PHONEVIEWS_WINDOW_WIDTH = 100;

constexpr int TRUNKVIEWS_WINDOW_STARTING_ROW = 24;
constexpr int TRUNKVIEWS_WINDOW_STARTING_COL = 1;
constexpr int TRUNKVIEWS_WINDOW_HEIGHT = 10;
constexpr int TRUNKVIEWS_WINDOW_WIDTH = 100;

constexpr int CMDPROCESSOR_VIEW_WINDOW_STARTING_ROW = 36;
constexpr int CMDPROCESSOR_VIEW_WINDOW_STARTING_COL = 1;
constexpr int CMDPROCESSOR_VIEW_WINDOW_HEIGHT = 5;
constexpr int CMDPROCESSOR_VIEW_WINDOW_WIDTH = 100;

// Rows of the separator lines drawn on the standard screen between the windows.
constexpr int SYSVIEW_SEPARATOR_ROW = 11;
constexpr int PHONEVIEWS_SEPARATOR_ROW = 23;
constexpr int TRUNKVIEWS_SEPARATOR_ROW = 35;

// Field columns in a row of the phone views window.
constexpr int PHONE_VIEW_START_COL = 8;
constexpr int CALLID_START_COL = 8;
constexpr int CALLID_FIELD_LENGTH = 8;
constexpr int CHAN_STATE_START_COL = 19;
constexpr int CHAN_STATE_FIELD_LENGTH = 25;
constexpr int CALL_STATE_START_COL = 47;
constexpr int CALL_STATE_FIELD_LENGTH = 20;
constexpr int REASON_START_COL = 70;
constexpr int REASON_FIELD_LENGTH = 25;

// Field columns in a row of the trunk views window.
constexpr int TRUNK_VIEW_START_COL = 8;
constexpr int LINESTATE_START_COL = 8;
constexpr int LINESTATE_FIELD_LENGTH = 15;
constexpr int LINESTATE_REASON_START_COL = 26;
constexpr int LINESTATE_REASON_FIELD_LENGTH = 13;
constexpr int LOS_CFA_START_COL = 42;
constexpr int LOS_CFA_FIELD_LENGTH = 3;
constexpr int LOOPBACK_CFA_START_COL = 48;
constexpr int LOOPBACK_CFA_FIELD_LENGTH = 3;
constexpr int RED_CFA_START_COL = 54;
constexpr int RED_CFA_FIELD_LENGTH = 3;
constexpr int YELLOW_CFA_START_COL = 60;
constexpr int YELLOW_CFA_FIELD_LENGTH = 3;
constexpr int CRC_CFA_START_COL = 66;
constexpr int CRC_CFA_FIELD_LENGTH = 3;
constexpr int AIS_CFA_START_COL = 72;
constexpr int AIS_CFA_FIELD_LENGTH = 3;
constexpr int DCHAN_START_COL = 78;
constexpr int DCHAN_FIELD_LENGTH = 4;
constexpr int BPVS_START_COL = 85;
constexpr int BPVS_FIELD_LENGTH = 4;
constexpr int FERR_START_COL = 92;
constexpr int FERR_FIELD_LENGTH = 4;

}  // namespace lineprobe
