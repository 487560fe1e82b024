#include "tools/Convert.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <string>

#include "rox/RoxMempool.h"
#include "sorn/model/Schema.h"
#include "tools/ExitCode.h"
#include "tools/LineReader.h"
#include "tools/Output.h"
#include "tools/Progress.h"
#include "tools/RecordForms.h"

namespace sorn::tools {

namespace {

/// Writes the record in its new form and gives true; or gives words and false.
bool ConvertRecord(const ConvertOptions& options, const std::string& record, std::FILE* out,
                   std::string& words) {
    RoxMempool pool("sorn convert");
    const ref<SornObject> object = ReadRecord(options, &pool, record, words);
    if (object == nullptr) return false;
    WriteRecord(options, &pool, object, out);
    return true;
}

void WriteWords(const std::string& words) {
    std::fwrite(words.data(), 1, words.size(), stderr);
    std::fputc('\n', stderr);
}

/// False when a line was refused.
bool ConvertLines(const ConvertOptions& options, LineReader& reader, std::FILE* in, std::FILE* out) {
    Progress progress(in, out);
    bool fAllDone = true;
    std::string record;
    std::string words;
    for (unsigned long number = 1; std::ferror(out) == 0; ++number) {
        if (!reader.FLineReady()) std::fflush(out);  // the next line may be long in coming
        if (!reader.ReadLine(record)) break;
        if (!ConvertRecord(options, record, out, words)) {
            fAllDone = false;
            std::fputc('\n', out);
            progress.Hide();
            WriteWords("line " + std::to_string(number) + ": " + words);
        }
        progress.Advance(record.size() + 1);
    }
    return fAllDone;
}

bool ConvertOne(const ConvertOptions& options, LineReader& reader, std::FILE* out) {
    std::string record;
    std::string words;
    if (!reader.ReadAll(record) || ConvertRecord(options, record, out, words)) return true;
    WriteWords(words);
    return false;
}

int ConvertStream(const ConvertOptions& options, std::FILE* in, std::FILE* out) {
    LineReader reader(::fileno(in));
    const bool fAllDone =
        options.lines ? ConvertLines(options, reader, in, out) : ConvertOne(options, reader, out);
    if (reader.FFailed()) std::fputs("the input could not be read, or a record is 4 GiB or longer\n", stderr);
    return FinishOutput(out) && fAllDone && !reader.FFailed() ? DONE : SOME_REFUSED;
}

/// Whether the path names the open file; opening it for output would empty it.
bool FSameFile(const std::string& path, std::FILE* file) {
    struct stat a {};
    struct stat b {};
    return ::stat(path.c_str(), &a) == 0 && ::fstat(::fileno(file), &b) == 0 && S_ISREG(a.st_mode) &&
           a.st_dev == b.st_dev && a.st_ino == b.st_ino;
}

int ConvertInto(const ConvertOptions& options, std::FILE* in) {
    if (!options.outPath.empty() && FSameFile(options.outPath, in)) {
        std::fprintf(stderr, "%s: is the input, too\n", options.outPath.c_str());
        return WRONG_USAGE;
    }
    std::FILE* const standard = TakeStandardOutput();
    if (standard == nullptr) return SOME_REFUSED;
    std::FILE* const out = OpenFile(options.outPath, "wbe", standard);
    if (out == nullptr) return WRONG_USAGE;
    int code = ConvertStream(options, in, out);
    if (std::fclose(out) != 0) {
        std::perror(options.outPath.empty() ? "standard output" : options.outPath.c_str());
        code = SOME_REFUSED;
    }
    return code;
}

/// Whether the options go together; words if not. The dictionary road tells for each record what is wrong
/// with a version, and the typed road would leave out every field.
bool FCheck(const ConvertOptions& options) {
    const int version = options.schemaVersion;
    const bool isKnown =
        version == 0 || (version >= Schema::firstSchemaVersionG && version <= Schema::lastSchemaVersionG);
    if (isKnown || options.road != "typed") return true;
    std::fprintf(stderr, "--schema-version: the schema has the versions %d to %d\n",
                 static_cast<int>(Schema::firstSchemaVersionG), static_cast<int>(Schema::lastSchemaVersionG));
    return false;
}

}  // namespace

int Convert(const ConvertOptions& options) {
    if (!FCheck(options)) return WRONG_USAGE;
    std::FILE* in = OpenFile(options.inPath, "rbe", stdin);
    if (in == nullptr) return WRONG_USAGE;
    const int code = ConvertInto(options, in);
    if (in != stdin) std::fclose(in);
    return code;
}

}  // namespace sorn::tools
