#include "platform/unitmap/AuTree.h"

#include <cstring>

namespace unitmap {

namespace {

Attribute text(const char* name, const std::string& value) {
    Attribute a;
    a.name = name;
    a.kind = Attribute::Kind::Text;
    a.text = value;
    return a;
}

Attribute number(const char* name, std::uint32_t value) {
    Attribute a;
    a.name = name;
    a.kind = Attribute::Kind::Number;
    a.number = value;
    return a;
}

Attribute address(const char* name, const farm::Address& value) {
    Attribute a;
    a.name = name;
    a.kind = Attribute::Kind::Address;
    a.address = value;
    return a;
}

}  // namespace

const Attribute* Au::attribute(const char* name) const {
    for (const auto& a : attributes) {
        if (a.name == name) {
            return &a;
        }
    }
    return nullptr;
}

AuTree::AuTree(const farm::Farm& farm) {
    add(0).attributes.push_back(text(kName, farm.systemName));
    for (const auto& b : farm.boards) {
        addBoard(b);
    }
}

Au& AuTree::add(UM_AUID parent) {
    Au au;
    au.handle = static_cast<UM_AUID>(aus_.size() + 1);
    au.parent = parent;
    if (parent != 0) {
        aus_[parent - 1].children.push_back(au.handle);
    }
    aus_.push_back(std::move(au));
    return aus_.back();
}

void AuTree::addBoard(const farm::Board& b) {
    const UM_AUID board = add(host()).handle;
    aus_[board - 1].attributes = {
        text(kPlatform, kPlatformValue),
        number(kLogicalId, b.logicalId),
        text(kName, b.name),
        text(kSerialNumber, b.serial),
        number(kNumTrunks, static_cast<std::uint32_t>(b.trunks.size())),
    };
    for (const auto& t : b.trunks) {
        add(board).attributes = {
            number(kType, UM_TYPE_LINE),
            number(kChannelCount, static_cast<std::uint32_t>(t.channels)),
            address(kLineAdminAddr, farm::lconAddress(b.logicalId, t.number)),
        };
    }
    const int voices = b.voiceChannelCount();
    UM_AUID group = 0;
    for (int v = 1; v <= voices; ++v) {
        if ((v - 1) % kVoicesPerGroup == 0) {
            group = add(board).handle;
            aus_[group - 1].attributes = {number(kType, UM_TYPE_VOICE_GROUP)};
        }
        Au& voice = add(group);
        voice.attributes.push_back(number(kType, UM_TYPE_VOICE));
        voice.attributes.push_back(address(kClusterAddr, farm::rocClusterAddress(b.logicalId, v)));
        for (farm::Media m : b.media) {
            voice.attributes.push_back(
                address(farm::mediaAttribute(m), farm::mediaAddress(b.logicalId, v, m)));
        }
    }
}

const Au* AuTree::find(UM_AUID handle) const {
    if (handle < 1 || handle > aus_.size()) {
        return nullptr;
    }
    return &aus_[handle - 1];
}

std::vector<const Au*> AuTree::below(UM_AUID parent) const {
    std::vector<const Au*> out;
    const Au* p = find(parent);
    if (!p) {
        return out;
    }
    std::vector<UM_AUID> stack(p->children.rbegin(), p->children.rend());
    while (!stack.empty()) {
        const Au* au = find(stack.back());
        stack.pop_back();
        out.push_back(au);
        stack.insert(stack.end(), au->children.rbegin(), au->children.rend());
    }
    return out;
}

std::uint32_t readAttribute(const Au& au, um_attribute& record) {
    if (!record.name || !record.value) {
        return record.status = UM_ERR_INVALID_ARGUMENT;
    }
    const Attribute* a = au.attribute(record.name);
    if (!a) {
        return record.status = UM_ERR_NO_SUCH_ATTRIBUTE;
    }
    switch (a->kind) {
        case Attribute::Kind::Text:
            if (record.size < a->text.size() + 1) {
                return record.status = UM_ERR_BUFFER_TOO_SMALL;
            }
            std::memcpy(record.value, a->text.c_str(), a->text.size() + 1);
            break;
        case Attribute::Kind::Number:
            if (record.size < sizeof a->number) {
                return record.status = UM_ERR_BUFFER_TOO_SMALL;
            }
            std::memcpy(record.value, &a->number, sizeof a->number);
            break;
        case Attribute::Kind::Address: {
            if (record.size < farm::kTKCompDescSize) {
                return record.status = UM_ERR_BUFFER_TOO_SMALL;
            }
            auto bytes = farm::encodeTKCompDesc(a->address);
            std::memcpy(record.value, bytes.data(), bytes.size());
            break;
        }
    }
    return record.status = UM_SUCCESS;
}

bool matches(const Au& au, const um_attribute& record) {
    const Attribute* a = au.attribute(record.name);
    if (!a) {
        return false;
    }
    const auto* value = static_cast<const unsigned char*>(record.value);
    switch (a->kind) {
        case Attribute::Kind::Text: {
            std::size_t n = ::strnlen(static_cast<const char*>(record.value), record.size);
            return a->text.size() == n && std::memcmp(a->text.data(), value, n) == 0;
        }
        case Attribute::Kind::Number: {
            std::uint32_t x = 0;
            if (record.size < sizeof x) {
                return false;
            }
            std::memcpy(&x, value, sizeof x);
            return x == a->number;
        }
        case Attribute::Kind::Address:
            return record.size >= farm::kTKCompDescSize &&
                   farm::decodeTKCompDesc(value) == a->address;
    }
    return false;
}

}  // namespace unitmap
