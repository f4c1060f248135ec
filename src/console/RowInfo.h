#pragma once

// One display row of a view manager's window, free or taken by a view.
class RowInfo {
  public:
    RowInfo(int row, int startingCol) : row(row), startingCol(startingCol) {}

    void InUse() { available = false; }
    void Available() { available = true; }
    bool IsAvailable() const { return available; }
    int GetStartingCol() const { return startingCol; }
    int GetRow() const { return row; }

  private:
    bool available = true;
    int row;
    int startingCol;
};
