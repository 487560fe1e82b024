#include <CLI/CLI.hpp>
#include <cstdio>
#include <exception>

#include "tools/Convert.h"
#include "tools/Describe.h"
#include "tools/ExitCode.h"

namespace {

/// Adds "sorn describe".
void AddDescribe(CLI::App& app, sorn::tools::DescribeOptions& options) {
    CLI::App* command =
        app.add_subcommand("describe", "Shows a record or an enumeration of the schema, or lists all");
    command->add_option("NAME", options.nameOrId, "Name or number of a record or an enumeration")
        ->option_text("NAME|ID");
    command->add_flag("--json", options.json,
                      "One JSON object: of all metadata, or of the record or enumeration named");
}

/// Adds "sorn convert".
void AddConvert(CLI::App& app, sorn::tools::ConvertOptions& options) {
    CLI::App* command = app.add_subcommand("convert", "Takes a record through its forms and writes it again");
    command->add_option("--from", options.from, "Form of the input")
        ->check(CLI::IsMember({"json", "binary"}))
        ->capture_default_str();
    command->add_option("--to", options.to, "Form of the output")
        ->check(CLI::IsMember({"json", "binary"}))
        ->capture_default_str();
    command
        ->add_option("--road", options.road,
                     "How JSON becomes an object and back: typed, straight, or dictionary, which honours the "
                     "version and required fields and sorts the names")
        ->check(CLI::IsMember({"typed", "dictionary"}))
        ->capture_default_str();
    command
        ->add_option("--schema-version", options.schemaVersion,
                     "Schema version to convert at; 0 takes every field")
        ->check(CLI::NonNegativeNumber)
        ->capture_default_str();
    command->add_flag("--pretty", options.pretty, "Line breaks and indentation; the names are sorted then");
    command->add_flag("--lines", options.lines,
                      "One record on each line, binary ones as Base64; a line that is refused gives an "
                      "empty line");
    command->add_option("-o,--output", options.outPath, "Output file (default: standard output)")
        ->option_text("OUT");
    command->add_option("IN", options.inPath, "Input file (default: standard input)")->option_text("IN");
}

int Run(int argc, char** argv) {
    CLI::App app{"The records of a digital video recorder platform: looks at their schema and converts them",
                 "sorn"};
    app.require_subcommand(1);
    app.set_help_all_flag("--help-all", "Help of all commands");
    sorn::tools::DescribeOptions describe;
    sorn::tools::ConvertOptions convert;
    AddDescribe(app, describe);
    AddConvert(app, convert);
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        return app.exit(error) == 0 ? sorn::tools::DONE : sorn::tools::WRONG_USAGE;
    }
    return app.got_subcommand("describe") ? sorn::tools::Describe(describe) : sorn::tools::Convert(convert);
}

}  // namespace

int main(int argc, char** argv) {
    try {
        return Run(argc, argv);
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "%s\n", failure.what());
        return sorn::tools::SOME_REFUSED;
    }
}
