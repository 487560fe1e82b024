#pragma once

#include <string>
#include <vector>

#include "pairs/BodyModel.h"
#include "pairs/Hostile.h"
#include "pairs/PairsFixture.h"
#include "rox/RoxFeatures.h"

namespace sorntest {

/// Bad input for the readers. What they make of it is either refused or written back; a sanitizer, the pool's
/// figures and the agreement of readers over the same bytes find the rest.
class HostileFixture : public PairsFixture {
 protected:
    void TearDown() override {
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
        PairsFixture::TearDown();
    }

    /// The records to begin with: one of the struct with every data type, and some from the examples.
    static std::vector<Record> Victims();

    using ForEachChange = void (*)(const std::string& bytes, const Attack& attack);
    /// Reads all changes of the bytes up to the first that fails. What the readers and the test print
    /// meanwhile is not shown, for the binary reader tells of each unknown field; a failure is made again for
    /// all to see.
    void Read(ForEachChange forEach, const std::string& bytes, const Attack& attack);

    unsigned nReadM = 0;
    unsigned nRefusedM = 0;
};

}  // namespace sorntest
