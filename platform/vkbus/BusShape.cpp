#include "vkbus/BusShape.h"

#include <algorithm>

using Type = VkBusTypeDescriptor;

// NOLINTNEXTLINE(misc-redundant-expression): not on every machine
static_assert(alignof(int64_t) == 8 && alignof(void*) == sizeof(void*) && sizeof(bool) == 1,
              "simple values are aligned to their size");

const BusStructDescriptor BusShape::noStructG = {0, "", 0, 0, nullptr};

const BusStructDescriptor* BusShape::FindStruct(uint32_t id) const {
    const BusTypeLookup found = pLibraryM->lookup(nullptr, id, nullptr);
    return found.kind == BusKind::STRUCT ? static_cast<const BusStructDescriptor*>(found.descriptor)
                                         : nullptr;
}

const BusProtocolDescriptor* BusShape::FindProtocol(uint32_t id) const {
    const BusTypeLookup found = pLibraryM->lookup(nullptr, id, nullptr);
    return found.kind == BusKind::PROTOCOL ? static_cast<const BusProtocolDescriptor*>(found.descriptor)
                                           : nullptr;
}

char BusShape::LetterOf(uint32_t type) {
    switch (type) {
        case Type::SHORT:
            return 'n';
        case Type::UNSIGNED_SHORT:
            return 'q';
        case Type::LONG:
        case Type::ENUM:
            return 'i';
        case Type::UNSIGNED_LONG:
            return 'u';
        case Type::LONG_LONG:
            return 'x';
        case Type::UNSIGNED_LONG_LONG:
            return 't';
        case Type::STRING:
            return 's';
        case Type::OCTET:
            return 'y';
        case Type::BOOLEAN:
            return 'b';
        default:
            return 0;
    }
}

size_t BusShape::AlignInMessages(char letter) {
    switch (letter) {
        case 'y':
        case 'v':
            return 1;
        case 'n':
        case 'q':
            return 2;
        case 'x':
        case 't':
        case '(':
            return 8;
        default:
            return 4;
    }
}

size_t BusShape::SizeOfSimple(uint32_t type) {
    switch (type) {
        case Type::OCTET:
        case Type::BOOLEAN:
            return 1;
        case Type::SHORT:
        case Type::UNSIGNED_SHORT:
            return 2;
        case Type::LONG_LONG:
        case Type::UNSIGNED_LONG_LONG:
            return 8;
        case Type::STRING:
            return sizeof(const char*);
        default:
            return 4;
    }
}

void BusShape::Skip(BusTypeWords& words) {
    uint32_t type = words.Next();
    while (type == Type::SEQUENCE || type == Type::OPTIONAL) {
        type = words.Next();
    }
    if (type == Type::STRUCT || type == Type::ENUM) {
        words.Next();
    }
}

bool BusShape::LayoutOf(BusTypeWords& words, unsigned depth, BusLayout& layout) const {
    const uint32_t type = words.Next();
    if (depth >= maxDepthG) {
        return false;
    }
    switch (type) {
        case Type::SEQUENCE:
            Skip(words);
            layout = {sizeof(BusSequence<char>), alignof(BusSequence<char>)};
            return true;
        case Type::OPTIONAL:
            Skip(words);
            layout = {sizeof(void*), alignof(void*)};
            return true;
        case Type::STRUCT: {
            const BusStructDescriptor* descriptor = FindStruct(words.Next());
            return descriptor != nullptr && LayoutOfStruct(*descriptor, depth + 1, layout);
        }
        case Type::ANYSTRUCT:
            layout = {sizeof(BusAnyStruct), alignof(BusAnyStruct)};
            return true;
        case Type::ENUM:
            words.Next();
            break;  // whose items do not matter
        default:
            break;
    }
    const size_t size = SizeOfSimple(type);
    layout = {size, size};
    return LetterOf(type) != 0;
}

bool BusShape::LayoutOfStruct(const BusStructDescriptor& descriptor, unsigned depth,
                              BusLayout& layout) const {
    layout = {0, 1};
    for (uint32_t i = 0; i < descriptor.nMembers; ++i) {
        BusTypeWords words(descriptor.vMember[i]);
        BusLayout member;
        if (!LayoutOf(words, depth, member)) {
            return false;
        }
        layout.size = BusLayout::Align(layout.size, member.align) + member.size;
        layout.align = std::max(layout.align, member.align);
    }
    layout.size = std::max<size_t>(BusLayout::Align(layout.size, layout.align), 1);
    return true;
}

bool BusShape::Sign(BusTypeWords& words, unsigned depth, BusSignature& signature) const {
    const uint32_t type = words.Next();
    if (depth >= maxDepthG) {
        return false;
    }
    switch (type) {
        case Type::SEQUENCE:
        case Type::OPTIONAL:
            return signature.Add('a') && Sign(words, depth + 1, signature);
        case Type::STRUCT: {
            const BusStructDescriptor* descriptor = FindStruct(words.Next());
            return descriptor != nullptr && SignStruct(*descriptor, depth + 1, signature);
        }
        case Type::ANYSTRUCT:
            return signature.Add('(') && signature.Add('u') && signature.Add('v') && signature.Add(')');
        case Type::ENUM:
            words.Next();
            break;
        default:
            break;
    }
    const char letter = LetterOf(type);
    return letter != 0 && signature.Add(letter);
}

bool BusShape::SignStruct(const BusStructDescriptor& descriptor, unsigned depth,
                          BusSignature& signature) const {
    if (descriptor.nMembers == 0) {
        return signature.Add('y');
    }
    return signature.Add('(') && SignMembers(descriptor, depth, signature) && signature.Add(')');
}

bool BusShape::SignMembers(const BusStructDescriptor& descriptor, unsigned depth,
                           BusSignature& signature) const {
    for (uint32_t i = 0; i < descriptor.nMembers; ++i) {
        BusTypeWords words(descriptor.vMember[i]);
        if (!Sign(words, depth, signature)) {
            return false;
        }
    }
    return true;
}
