#include "vkbus/BusMarshaller.h"

#include <cstring>

using Type = VkBusTypeDescriptor;

namespace {

// What stands at an address in a record.
template <class T>
T At(const unsigned char* at) {
    T value;
    memcpy(&value, at, sizeof(value));
    return value;
}

}  // namespace

bool BusMarshaller::Open(char container, const char* contents) {
    return sd_bus_message_open_container(pMessageM, container, contents) >= 0;
}

bool BusMarshaller::Close() {
    return sd_bus_message_close_container(pMessageM) >= 0;
}

bool BusMarshaller::AddUnsigned(uint32_t value) {
    return sizeM.Add(4, 4) && sd_bus_message_append_basic(pMessageM, 'u', &value) >= 0;
}

bool BusMarshaller::AddMembers(const BusStructDescriptor& descriptor, const unsigned char* record,
                               unsigned depth) {
    return shapeM.WalkMembers(descriptor, depth, [=, this](BusTypeWords& words, size_t offset) {
        return AddValue(words, record + offset, depth);
    });
}

bool BusMarshaller::AddValue(BusTypeWords& words, const unsigned char* at, unsigned depth) {
    if (depth >= BusShape::maxDepthG) {
        return false;
    }
    const uint32_t type = words.Next();
    switch (type) {
        case Type::SEQUENCE:
            return AddSequence(words, at, depth);
        case Type::OPTIONAL:
            return AddOptional(words, at, depth);
        case Type::ANYSTRUCT:
            return AddAnyStruct(At<BusAnyStruct>(at), depth);
        case Type::STRUCT: {
            const BusStructDescriptor* descriptor = shapeM.FindStruct(words.Next());
            return descriptor != nullptr && AddStruct(*descriptor, at, depth + 1);
        }
        case Type::ENUM:
            words.Next();
            break;
        default:
            break;
    }
    return AddSimple(type, at);
}

bool BusMarshaller::AddSimple(uint32_t type, const unsigned char* at) {
    const char letter = BusShape::LetterOf(type);
    switch (letter) {
        case 0:
            return false;
        case 's': {
            const char* text = At<const char*>(at);
            text = text != nullptr ? text : "";
            return sizeM.AddText(strlen(text)) && sd_bus_message_append_basic(pMessageM, 's', text) >= 0;
        }
        case 'b': {
            const int flag = *at != 0;
            return sizeM.Add(4, 4) && sd_bus_message_append_basic(pMessageM, 'b', &flag) >= 0;
        }
        default: {
            const size_t size = BusShape::SizeOfSimple(type);
            return sizeM.Add(size, size) && sd_bus_message_append_basic(pMessageM, letter, at) >= 0;
        }
    }
}

bool BusMarshaller::AddSequence(BusTypeWords& words, const unsigned char* at, unsigned depth) {
    const auto sequence = At<BusSequence<unsigned char>>(at);
    if (sequence.count > 0 && sequence.vElement == nullptr) {
        return false;
    }
    BusTypeWords element = words;
    const uint32_t type = element.Next();
    if (!BusShape::FSameInMessages(type)) {
        return AddElements(words, sequence.vElement, sequence.count, depth);
    }
    BusShape::Skip(words);
    const size_t size = BusShape::SizeOfSimple(type);
    const uint64_t nBytes = uint64_t{sequence.count} * size;
    return sizeM.Add(4, 4) && sizeM.Add(size, nBytes) &&
           sd_bus_message_append_array(pMessageM, BusShape::LetterOf(type), sequence.vElement,
                                       static_cast<size_t>(nBytes)) >= 0;
}

bool BusMarshaller::AddOptional(BusTypeWords& words, const unsigned char* at, unsigned depth) {
    const unsigned char* element = At<const unsigned char*>(at);
    return AddElements(words, element, element != nullptr, depth);
}

bool BusMarshaller::AddElements(BusTypeWords& words, const unsigned char* vElement, uint32_t count,
                                unsigned depth) {
    const BusTypeWords first = words;
    BusSignature signature;
    BusLayout layout;
    BusTypeWords forLayout = words;
    if (!shapeM.Sign(words, depth + 1, signature) || !shapeM.LayoutOf(forLayout, depth + 1, layout) ||
        !sizeM.Add(4, 4) || !sizeM.Add(BusShape::AlignInMessages(signature.text[0]), 0) ||
        !Open('a', signature.text)) {
        return false;
    }
    for (uint32_t i = 0; i < count; ++i) {
        BusTypeWords element = first;
        if (!AddValue(element, vElement + i * layout.size, depth + 1)) {
            return false;
        }
    }
    return Close();
}

bool BusMarshaller::AddStruct(const BusStructDescriptor& descriptor, const unsigned char* at,
                              unsigned depth) {
    if (descriptor.nMembers == 0) {
        const unsigned char filler = 0;
        return AddSimple(Type::OCTET, &filler);
    }
    BusSignature members;
    return shapeM.SignMembers(descriptor, depth, members) && sizeM.Add(8, 0) && Open('r', members.text) &&
           AddMembers(descriptor, at, depth) && Close();
}

bool BusMarshaller::AddAnyStruct(const BusAnyStruct& any, unsigned depth) {
    const bool fAny = any.pStruct != nullptr;
    const BusStructDescriptor* descriptor = fAny ? shapeM.FindStruct(any.id) : &BusShape::noStructG;
    BusSignature signature;
    return descriptor != nullptr && shapeM.SignStruct(*descriptor, depth + 1, signature) && sizeM.Add(8, 0) &&
           Open('r', "uv") && AddUnsigned(fAny ? any.id : 0) && sizeM.AddSignature(signature.length) &&
           Open('v', signature.text) &&
           AddStruct(*descriptor, static_cast<const unsigned char*>(any.pStruct), depth + 1) && Close() &&
           Close();
}
