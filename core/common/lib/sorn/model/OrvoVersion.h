#pragma once

namespace sorn {

/// A schema version. 0 stands for the absence of a version: every field is taken in its current form. Any
/// other value selects the fields of that version; converters that honour versions refuse one outside
/// Schema::firstSchemaVersionG to Schema::lastSchemaVersionG.
class OrvoVersion {
 public:
    constexpr OrvoVersion() = default;
    constexpr OrvoVersion(int number) : numberM(number) {}  // implicit on purpose: callers pass plain numbers

    constexpr int Number() const { return numberM; }
    /// True when no version was given.
    constexpr bool FAbsent() const { return numberM == 0; }

    friend constexpr bool operator==(OrvoVersion a, OrvoVersion b) { return a.numberM == b.numberM; }
    friend constexpr bool operator!=(OrvoVersion a, OrvoVersion b) { return a.numberM != b.numberM; }

 private:
    int numberM = 0;
};

}  // namespace sorn
