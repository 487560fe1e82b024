#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>

#include "schema/MetadataDump.h"

namespace {

constexpr char goldenPathG[] = SORN_SOURCE_DIR "/schema/golden/metadata.txt";

std::string FirstDifference(const std::string& expected, const std::string& actual) {
    std::istringstream a(expected), b(actual);
    std::string lineA, lineB;
    for (unsigned number = 1;; ++number) {
        const bool fA = static_cast<bool>(std::getline(a, lineA));
        const bool fB = static_cast<bool>(std::getline(b, lineB));
        if (!fA && !fB) return "same lines";
        if (fA != fB || lineA != lineB) {
            return "line " + std::to_string(number) + "\n  golden: " + (fA ? lineA : "(end)") +
                   "\n  now:    " + (fB ? lineB : "(end)");
        }
    }
}

TEST(GoldenMetadataTest, CompiledTablesAreTheGoldenOnes) {
    std::ifstream file(goldenPathG, std::ios::binary);
    const std::string golden((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    const std::string now = DumpMetadata();
    if (golden == now) return;
    const std::filesystem::path fresh = std::filesystem::absolute("metadata.txt");
    std::ofstream(fresh, std::ios::binary) << now;
    FAIL() << "the metadata changed, first in " << FirstDifference(golden, now)
           << "\nNumbers on the wire must never change. "
           << "If the change is meant: cp " << fresh << ' ' << goldenPathG;
}

}  // namespace
