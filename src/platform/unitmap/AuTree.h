#pragma once

// The device map's AU tree for one farm; unitmap.h describes its shape and what it answers.

#include <cstdint>
#include <string>
#include <vector>

#include "platform/farm/Addresses.h"
#include "platform/farm/Farm.h"
#include "platform/unitmap/unitmap.h"

namespace unitmap {

// The attribute names, exactly as the tool asks for them.
inline constexpr const char* kName = "NAME";
inline constexpr const char* kPlatform = "CTPLATFORM";
inline constexpr const char* kLogicalId = "LOGICAL ID";
inline constexpr const char* kSerialNumber = "SERIAL_NUMBER";
inline constexpr const char* kNumTrunks = "NUM_TRUNKS";
inline constexpr const char* kType = "TYPE";
inline constexpr const char* kChannelCount = "ChannelCount";
inline constexpr const char* kLineAdminAddr = "LINEADMINADDR";
inline constexpr const char* kClusterAddr = "CLUSTERADDR";
inline constexpr const char* kPlatformValue = "VX7";
inline constexpr int kVoicesPerGroup = 4;

struct Attribute {
    enum class Kind { Text, Number, Address };
    std::string name;
    Kind kind = Kind::Number;
    std::string text;
    std::uint32_t number = 0;
    farm::Address address;
};

struct Au {
    UM_AUID handle = 0;
    UM_AUID parent = 0;
    std::vector<Attribute> attributes;
    std::vector<UM_AUID> children;

    const Attribute* attribute(const char* name) const;
};

class AuTree {
  public:
    explicit AuTree(const farm::Farm& farm);

    UM_AUID host() const { return 1; }
    const Au* find(UM_AUID handle) const;
    // Every AU below `parent`, depth first, in tree order.
    std::vector<const Au*> below(UM_AUID parent) const;

  private:
    Au& add(UM_AUID parent);
    void addBoard(const farm::Board& b);

    std::vector<Au> aus_;  // aus_[h - 1] has handle h
};

// Copies an attribute's value into a caller's record; the record's status tells how it went.
std::uint32_t readAttribute(const Au& au, um_attribute& record);
// Whether an AU has the attribute with the value a search record gives.
bool matches(const Au& au, const um_attribute& record);

}  // namespace unitmap
