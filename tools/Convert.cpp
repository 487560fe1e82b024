#include "tools/Convert.h"

#include <sys/stat.h>

#include <cstdio>
#include <string>

#include "rox/RoxMempool.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/json/JsonFormat.h"
#include "sorn/model/Schema.h"
#include "tools/ExitCode.h"
#include "tools/LineReader.h"
#include "tools/Output.h"
#include "tools/Progress.h"

namespace sorn::tools {

namespace {

/// Text to dictionary to object to dictionary. A null dictionary and words when the record is refused.
ref<Dictionary> TakeThroughObject(RoxMempool* pool, const std::string& text, OrvoVersion version,
                                  RoxString& error) {
    ref<Dictionary> dictionary = Dictionary::FromJson(reinterpret_cast<const unsigned char*>(text.data()),
                                                      static_cast<unsigned>(text.size()), error, pool);
    if (!dictionary) return nullptr;
    DictionarySornObject converter(pool, Schema::vStructDefG, Schema::nStructDefG);
    ref<SornObject> object;
    if (!converter.DictionaryToSornObject(dictionary, version, object, error)) return nullptr;
    return converter.SornObjectToDictionary(object.get(), version);
}

/// Writes the record's text and a line feed, and gives true; or gives the words and false. The text goes out
/// in pieces: pretty text of a deep record is much longer than the record.
bool ConvertRecord(const ConvertOptions& options, const std::string& record, std::FILE* out,
                   std::string& words) {
    RoxMempool pool("sorn convert");
    RoxString error;
    const ref<Dictionary> result = TakeThroughObject(&pool, record, options.schemaVersion, error);
    if (!result) {
        words = std::string(error.View()) + "\n";
        return false;
    }
    FileSink sink(out);
    result->ToJson(sink, JsonFormat(options.pretty));
    std::fputc('\n', out);
    return true;
}

void WriteWords(const std::string& words) {
    std::fwrite(words.data(), 1, words.size(), stderr);
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

std::FILE* Open(const std::string& path, const char* mode, std::FILE* standard) {
    if (path.empty()) return standard;
    std::FILE* file = std::fopen(path.c_str(), mode);
    if (file == nullptr) std::perror(path.c_str());
    return file;
}

int ConvertInto(const ConvertOptions& options, std::FILE* in) {
    if (!options.outPath.empty() && FSameFile(options.outPath, in)) {
        std::fprintf(stderr, "%s: is the input, too\n", options.outPath.c_str());
        return WRONG_USAGE;
    }
    std::FILE* out = Open(options.outPath, "wbe", stdout);
    if (out == nullptr) return WRONG_USAGE;
    int code = ConvertStream(options, in, out);
    if (out != stdout && std::fclose(out) != 0) {
        std::perror(options.outPath.c_str());
        code = SOME_REFUSED;
    }
    return code;
}

}  // namespace

int Convert(const ConvertOptions& options) {
    std::FILE* in = Open(options.inPath, "rbe", stdin);
    if (in == nullptr) return WRONG_USAGE;
    const int code = ConvertInto(options, in);
    if (in != stdin) std::fclose(in);
    return code;
}

}  // namespace sorn::tools
