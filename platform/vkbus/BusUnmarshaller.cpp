#include "vkbus/BusUnmarshaller.h"

#include <algorithm>
#include <cstring>

using Type = VkBusTypeDescriptor;

namespace {

template <class T>
void Put(unsigned char* at, const T& value) {
    memcpy(at, &value, sizeof(value));
}

}  // namespace

bool BusUnmarshaller::Enter(char container, const char* contents) {
    return sd_bus_message_enter_container(pMessageM, container, contents) > 0;
}

bool BusUnmarshaller::Leave() {
    return sd_bus_message_exit_container(pMessageM) >= 0;
}

bool BusUnmarshaller::ReadUnsigned(uint32_t& value) {
    return sizeM.Add(4, 4) && sd_bus_message_read_basic(pMessageM, 'u', &value) > 0;
}

void* BusUnmarshaller::ReadRecord(const BusStructDescriptor& descriptor) {
    void* record = MakeRecord(descriptor, 0);
    return record != nullptr && ReadMembers(descriptor, static_cast<unsigned char*>(record), 0) ? record
                                                                                                : nullptr;
}

void* BusUnmarshaller::MakeRecord(const BusStructDescriptor& descriptor, unsigned depth) {
    BusLayout layout;
    return shapeM.LayoutOfStruct(descriptor, depth, layout) ? arenaM.Take(layout.size) : nullptr;
}

bool BusUnmarshaller::ReadMembers(const BusStructDescriptor& descriptor, unsigned char* record,
                                  unsigned depth) {
    return shapeM.WalkMembers(descriptor, depth, [=, this](BusTypeWords& words, size_t offset) {
        return ReadValue(words, record + offset, depth);
    });
}

bool BusUnmarshaller::ReadValue(BusTypeWords& words, unsigned char* at, unsigned depth) {
    if (depth >= BusShape::maxDepthG) {
        return false;
    }
    const uint32_t type = words.Next();
    switch (type) {
        case Type::SEQUENCE:
            return ReadSequence(words, at, depth);
        case Type::OPTIONAL:
            return ReadOptional(words, at, depth);
        case Type::ANYSTRUCT:
            return ReadAnyStruct(at, depth);
        case Type::STRUCT: {
            const BusStructDescriptor* descriptor = shapeM.FindStruct(words.Next());
            return descriptor != nullptr && ReadStruct(*descriptor, at, depth + 1);
        }
        case Type::ENUM:
            words.Next();
            break;
        default:
            break;
    }
    return ReadSimple(type, at);
}

bool BusUnmarshaller::ReadSimple(uint32_t type, unsigned char* at) {
    const char letter = BusShape::LetterOf(type);
    switch (letter) {
        case 0:
            return false;
        case 's': {
            const char* text = nullptr;
            if (sd_bus_message_read_basic(pMessageM, 's', &text) <= 0 || !sizeM.AddText(strlen(text))) {
                return false;
            }
            Put(at, text);
            return true;
        }
        case 'b': {
            int flag = 0;
            if (!sizeM.Add(4, 4) || sd_bus_message_read_basic(pMessageM, 'b', &flag) <= 0) {
                return false;
            }
            *at = flag != 0;
            return true;
        }
        default: {
            const size_t size = BusShape::SizeOfSimple(type);
            return sizeM.Add(size, size) && sd_bus_message_read_basic(pMessageM, letter, at) > 0;
        }
    }
}

bool BusUnmarshaller::ReadSequence(BusTypeWords& words, unsigned char* at, unsigned depth) {
    BusTypeWords element = words;
    const uint32_t type = element.Next();
    if (BusShape::FSameInMessages(type)) {
        BusShape::Skip(words);
        return ReadRow(type, at);
    }
    BusSequence<unsigned char> found;
    if (!ReadElements(words, depth, UINT32_MAX, found)) {
        return false;
    }
    Put(at, found);
    return true;
}

bool BusUnmarshaller::ReadRow(uint32_t type, unsigned char* at) {
    const size_t size = BusShape::SizeOfSimple(type);
    const void* vElement = nullptr;
    size_t nBytes = 0;
    if (sd_bus_message_read_array(pMessageM, BusShape::LetterOf(type), &vElement, &nBytes) <= 0 ||
        !sizeM.Add(4, 4) || !sizeM.Add(size, nBytes)) {
        return false;
    }
    BusSequence<unsigned char> row = {};
    if (nBytes > 0) {
        row.count = static_cast<uint32_t>(nBytes / size);
        row.vElement = static_cast<const unsigned char*>(vElement);
    }
    Put(at, row);
    return true;
}

bool BusUnmarshaller::ReadOptional(BusTypeWords& words, unsigned char* at, unsigned depth) {
    BusSequence<unsigned char> found;
    if (!ReadElements(words, depth, 1, found)) {
        return false;
    }
    Put(at, found.vElement);
    return true;
}

bool BusUnmarshaller::ReadElements(BusTypeWords& words, unsigned depth, uint32_t maxCount,
                                   BusSequence<unsigned char>& found) {
    const BusTypeWords first = words;
    BusTypeWords forLayout = words;
    BusSignature signature;
    BusLayout layout;
    if (!shapeM.Sign(words, depth + 1, signature) || !shapeM.LayoutOf(forLayout, depth + 1, layout) ||
        !sizeM.Add(4, 4) || !sizeM.Add(BusShape::AlignInMessages(signature.text[0]), 0) ||
        !Enter('a', signature.text)) {
        return false;
    }
    unsigned char* vElement = nullptr;
    uint32_t count = 0;
    uint32_t capacity = 0;
    int atEnd;
    while ((atEnd = sd_bus_message_at_end(pMessageM, 0)) == 0) {
        if (count == maxCount) {
            return false;
        }
        // Each element has a byte at least, so the message's size bounds the count.
        if (count == capacity) {
            capacity = std::min(std::max(4u, capacity * 2), maxCount);
            void* grown = arenaM.Take(capacity * layout.size);
            vElement =
                static_cast<unsigned char*>(count > 0 ? memcpy(grown, vElement, count * layout.size) : grown);
        }
        BusTypeWords element = first;
        if (!ReadValue(element, vElement + count * layout.size, depth + 1)) {
            return false;
        }
        ++count;
    }
    found = {};
    found.count = count;
    found.vElement = vElement;
    return atEnd > 0 && Leave();
}

bool BusUnmarshaller::ReadStruct(const BusStructDescriptor& descriptor, unsigned char* at, unsigned depth) {
    if (descriptor.nMembers == 0) {
        unsigned char filler;
        return ReadSimple(Type::OCTET, &filler);
    }
    BusSignature members;
    return shapeM.SignMembers(descriptor, depth, members) && sizeM.Add(8, 0) && Enter('r', members.text) &&
           ReadMembers(descriptor, at, depth) && Leave();
}

bool BusUnmarshaller::ReadAnyStruct(unsigned char* at, unsigned depth) {
    BusAnyStruct any = {};
    if (!sizeM.Add(8, 0) || !Enter('r', "uv") || !ReadUnsigned(any.id)) {
        return false;
    }
    const BusStructDescriptor* descriptor = any.id != 0 ? shapeM.FindStruct(any.id) : &BusShape::noStructG;
    BusSignature signature;
    if (descriptor == nullptr || !shapeM.SignStruct(*descriptor, depth + 1, signature) ||
        !sizeM.AddSignature(signature.length) || !Enter('v', signature.text)) {
        return false;
    }
    void* record = MakeRecord(*descriptor, depth + 1);
    if (record == nullptr || !ReadStruct(*descriptor, static_cast<unsigned char*>(record), depth + 1)) {
        return false;
    }
    any.pStruct = any.id != 0 ? record : nullptr;
    memset(at, 0, sizeof(any));
    Put(at, any);
    return Leave() && Leave();
}
