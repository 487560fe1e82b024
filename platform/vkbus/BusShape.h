#pragma once

#include <cstddef>

#include "vkbus/BusTypes.h"

/// The words of a member's type, read one by one.
class BusTypeWords {
 public:
    explicit BusTypeWords(const BusStructMemberDescriptor& member)
        : pNextM(member.vTypeWord), pEndM(member.vTypeWord + member.nTypeWords) {}

    /// The next word; 0, which is no type, behind the last.
    uint32_t Next() { return pNextM < pEndM ? *pNextM++ : 0; }

 private:
    const uint32_t* pNextM;
    const uint32_t* pEndM;
};

/// What a value takes in memory.
struct BusLayout {
    size_t size;
    size_t align;

    static size_t Align(size_t offset, size_t align) { return (offset + align - 1) / align * align; }
};

/// Text of a message body's types, ended by a zero.
struct BusSignature {
    static constexpr unsigned maxLengthG = 255;
    char text[maxLengthG + 1];
    unsigned length = 0;

    BusSignature() { text[0] = 0; }
    /// False when it gets too long.
    bool Add(char c) {
        if (length == maxLengthG) {
            return false;
        }
        text[length++] = c;
        text[length] = 0;
        return true;
    }
};

/// How the types of a library lie in memory and in messages:
///
///   type                message        type             message
///   SHORT               n              STRING           s
///   UNSIGNED_SHORT      q              SEQUENCE of T    aT
///   LONG                i              OPTIONAL T       aT with no or one element
///   UNSIGNED_LONG       u              STRUCT           (members), one y for a structure without members
///   LONG_LONG           x              ENUM             i
///   UNSIGNED_LONG_LONG  t              OCTET            y
///   BOOLEAN             b              ANYSTRUCT        (uv): id, and the structure as STRUCT; 0 and a y for
///   none
///
/// A structure that holds itself other than through ANYSTRUCT has no finite signature and cannot be sent.
/// Operations that read a type take its words from the given ones, and give false for one that is malformed,
/// unknown or nested too deeply.
class BusShape {
 public:
    /// Levels of values in values, ANYSTRUCT included; bounds the recursion of this class and of those that
    /// use it.
    static constexpr unsigned maxDepthG = 24;

    /// What an ANYSTRUCT that holds none holds in messages.
    static const BusStructDescriptor noStructG;

    explicit BusShape(const VkBusTypeLibrary& library) : pLibraryM(&library) {}

    const VkBusTypeLibrary& Library() const { return *pLibraryM; }
    /// Null for an id that is no structure.
    const BusStructDescriptor* FindStruct(uint32_t id) const;
    /// Null for an id that is no protocol.
    const BusProtocolDescriptor* FindProtocol(uint32_t id) const;

    /// Takes the words of one type.
    static void Skip(BusTypeWords& words);

    bool LayoutOf(BusTypeWords& words, unsigned depth, BusLayout& layout) const;
    bool LayoutOfStruct(const BusStructDescriptor& descriptor, unsigned depth, BusLayout& layout) const;

    /// Calls `member(words of its type, its offset in memory)` for each member in order, until one gives
    /// false.
    template <class Member>
    bool WalkMembers(const BusStructDescriptor& descriptor, unsigned depth, Member member) const {
        size_t offset = 0;
        for (uint32_t i = 0; i < descriptor.nMembers; ++i) {
            BusTypeWords words(descriptor.vMember[i]);
            BusTypeWords again = words;
            BusLayout layout;
            if (!LayoutOf(again, depth, layout)) {
                return false;
            }
            offset = BusLayout::Align(offset, layout.align);
            if (!member(words, offset)) {
                return false;
            }
            offset += layout.size;
        }
        return true;
    }

    /// Adds the signature of a type.
    bool Sign(BusTypeWords& words, unsigned depth, BusSignature& signature) const;
    /// Adds that of a structure as a value.
    bool SignStruct(const BusStructDescriptor& descriptor, unsigned depth, BusSignature& signature) const;
    /// Adds those of its members, one after the other.
    bool SignMembers(const BusStructDescriptor& descriptor, unsigned depth, BusSignature& signature) const;

    /// The letter in messages of a type that stands alone or is an ENUM; 0 for others.
    static char LetterOf(uint32_t type);
    /// The bytes in memory of the same.
    static size_t SizeOfSimple(uint32_t type);
    /// The alignment of a value in messages, given the first letter of its signature.
    static size_t AlignInMessages(char letter);
    /// Whether elements in a row lie in messages as they do in memory.
    static bool FSameInMessages(uint32_t type) {
        return LetterOf(type) != 0 && type != VkBusTypeDescriptor::STRING &&
               type != VkBusTypeDescriptor::BOOLEAN;
    }

 private:
    const VkBusTypeLibrary* pLibraryM;
};
