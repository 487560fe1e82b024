#include "tools/Convert.h"

#include <cstdio>
#include <string>

#include "rox/RoxMempool.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/Schema.h"
#include "tools/ExitCode.h"
#include "tools/LineReader.h"
#include "tools/Progress.h"

namespace sorn::tools {

namespace {

/// Text to dictionary to object to dictionary to text. A null dictionary and words when the record is
/// refused.
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

/// Converts records one after another and remembers how it went.
class Converter {
 public:
    Converter(const ConvertOptions& options, std::FILE* out) : optionsM(options), pOutM(out) {}

    /// Writes the record's line, an empty one when it is refused; `prefix` goes before the words.
    void ConvertRecord(const std::string& text, const std::string& prefix) {
        RoxMempool pool("sorn convert");
        RoxString error;
        const ref<Dictionary> result = TakeThroughObject(&pool, text, optionsM.schemaVersion, error);
        if (result) {
            const RoxString json = result->ToJson(optionsM.pretty);
            Write(json.Utf8(), json.NByte());
        } else {
            fRefusedM = true;
            const std::string words = prefix + std::string(error.View()) + "\n";
            std::fwrite(words.data(), 1, words.size(), stderr);
        }
        if (result || optionsM.lines) Write("\n", 1);
    }

    /// Flushes; false when something could not be written.
    bool Finish() { return std::fflush(pOutM) == 0 && !fWriteFailedM; }
    bool FWriteFailed() const { return fWriteFailedM; }
    bool FRefused() const { return fRefusedM; }

 private:
    void Write(const char* bytes, size_t n) { fWriteFailedM |= std::fwrite(bytes, 1, n, pOutM) != n; }

    const ConvertOptions& optionsM;
    std::FILE* pOutM;
    bool fRefusedM = false;
    bool fWriteFailedM = false;
};

int ConvertStream(const ConvertOptions& options, std::FILE* in, std::FILE* out) {
    Converter converter(options, out);
    LineReader reader(in);
    std::string record;
    bool fReadAll = true;
    if (options.lines) {
        Progress progress(in);
        for (unsigned long number = 1; !converter.FWriteFailed() && reader.ReadLine(record); ++number) {
            converter.ConvertRecord(record, "line " + std::to_string(number) + ": ");
            progress.Advance(record.size() + 1);
        }
        fReadAll = !reader.FFailed();
    } else {
        fReadAll = reader.ReadAll(record);
        if (fReadAll) converter.ConvertRecord(record, "");
    }
    if (!fReadAll) std::fprintf(stderr, "the input could not be read, or a record is 4 GiB or longer\n");
    const bool fWritten = converter.Finish();
    if (!fWritten) std::fprintf(stderr, "the output could not be written\n");
    return fReadAll && fWritten && !converter.FRefused() ? DONE : SOME_REFUSED;
}

std::FILE* Open(const std::string& path, const char* mode, std::FILE* standard) {
    if (path.empty()) return standard;
    std::FILE* file = std::fopen(path.c_str(), mode);
    if (file == nullptr) std::perror(path.c_str());
    return file;
}

}  // namespace

int Convert(const ConvertOptions& options) {
    std::FILE* in = Open(options.inPath, "rbe", stdin);
    if (in == nullptr) return WRONG_USAGE;
    std::FILE* out = Open(options.outPath, "wbe", stdout);
    if (out == nullptr) {
        if (in != stdin) std::fclose(in);
        return WRONG_USAGE;
    }
    int code = ConvertStream(options, in, out);
    if (in != stdin) std::fclose(in);
    if (out != stdout && std::fclose(out) != 0) {
        std::perror(options.outPath.c_str());
        code = SOME_REFUSED;
    }
    return code;
}

}  // namespace sorn::tools
