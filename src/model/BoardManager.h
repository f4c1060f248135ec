#pragma once

#include <map>
#include <memory>
#include <string>
#include <vector>

#include "model/Board.h"
#include "model/ROCCluster.h"
#include "platform/tkhost/tkhost.h"

namespace vx7diag {

// The record of one trunk.
struct m {
    int channelCount = 0;
    int trunkType = 0;
    // 4 CAS, 5 CCS, 6 clear channel.
    int signalingType = 0;
    TKCompDesc lineAdminAddr{};
    // Entry c is the voice channel of channel c (1..channelCount); entry 0 is unused. Filled only
    // under flexible routing.
    std::vector<unsigned int> voiceMap;
};

// The program's picture of one board, collected once by the constructor from the device map and
// from the board's own components, and read-only afterwards.
//
// A board the device map does not list (OpenBoard fails) gives an empty manager: no tolk::Board
// (GetBoard() is null), no name, no trunks, no flexible routing.
class BoardManager {
  public:
    // Boards are the device map's logical ids, 0 up to and including this one.
    static constexpr unsigned int LAST_LOGICAL_ID = 32;
    static constexpr int DIGITAL_BOARD = 1;
    static constexpr int ANALOG_BOARD = 2;

    explicit BoardManager(unsigned int board);
    BoardManager(const BoardManager&) = delete;
    BoardManager& operator=(const BoardManager&) = delete;
    virtual ~BoardManager();

    tolk::Board* GetBoard() const { return board.get(); }
    unsigned int GetBoardNumber() const { return boardNumber; }
    std::string GetBoardName() const;
    std::string GetSerialNumber() const;
    bool HasBoardName() const { return boardName != nullptr; }
    bool HasSerialNumber() const { return serialNumber != nullptr; }
    int GetNumberOfTrunks() const { return numTrunks; }
    void SetNumberOfTrunks(int n) { numTrunks = n; }
    int GetNumChannelsOnTrunk(unsigned int trunk) const;
    int GetTrunkType(unsigned int trunk) const;
    int GetSignalingType(unsigned int trunk) const;
    // 1 digital, 2 analog, 0 unknown; asks the board's LCON 1.
    int GetBoardType();
    int GetVoiceChannelCount() const { return voiceChannelCount; }
    int GetTelephonyMediaRoutingMode(unsigned int trunk, unsigned int channel) const;
    bool IsFlexibleRoutingEnabled() const { return routingMode == 1; }
    bool IsFlexibleRoutingEnabled(unsigned int trunk, unsigned int channel) const;
    // Null when routing is fixed, or the trunk or channel has no voice resource group.
    ROCCluster* GetTelephonyVoiceChannel(unsigned int trunk, unsigned int channel) const;
    MediaList GetMediaResources(unsigned int trunk, unsigned int channel) const;
    // The voice channel number of a channel, 0 if it has none.
    unsigned int GetVoiceChannelNumber(unsigned int trunk, unsigned int channel) const;
    const std::map<int, m>& GetTrunkInfo() const { return trunkInfo; }

  private:
    int OpenBoard(unsigned int board);
    int RetrieveBoardName();
    int RetrieveSerialNumber();
    int RetrieveTrunkCount();
    int RetrieveTrunkInfo();
    int RetrieveAnalogTrunkInfo();
    int GetTocRocParmValue();
    int RetrieveVoiceResources();
    int MapVoiceResources();
    std::unique_ptr<std::string> ReadBoardText(const char* attribute);

    std::unique_ptr<tolk::Board> board;
    unsigned int boardNumber = 0;
    int numTrunks = 0;
    int routingMode = 0;
    unsigned int hostAU = 0;
    unsigned int boardAU = 0;
    std::vector<unsigned int> trunkAUs;
    int voiceChannelCount = 0;
    std::unique_ptr<std::string> boardName;
    std::unique_ptr<std::string> serialNumber;
    std::map<int, m> trunkInfo;
    std::unique_ptr<std::map<unsigned int, std::unique_ptr<ROCCluster>>> rocClusters;
};

}  // namespace vx7diag
