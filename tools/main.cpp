#include <CLI/CLI.hpp>
#include <cstdio>
#include <exception>

#include "tools/Convert.h"
#include "tools/Describe.h"
#include "tools/ExitCode.h"
#include "tools/Frame.h"
#include "tools/PutAndRemove.h"
#include "tools/Send.h"
#include "tools/Serve.h"
#include "tools/Unframe.h"

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

/// Adds "sorn frame".
void AddFrame(CLI::App& app, sorn::tools::FrameOptions& options) {
    CLI::App* command =
        app.add_subcommand("frame", "Makes an ORPC/2 message of a body, or of lines that unframe wrote");
    command->add_option("KIND", options.kind, "Kind of message")
        ->check(CLI::IsMember({"request", "requestUpdate", "response", "cancel"}))
        ->option_text("request|requestUpdate|response|cancel");
    command->add_option("BODY", options.inPath, "File with the body's JSON (default: standard input)")
        ->option_text("BODY.json");
    command
        ->add_option_function<uint32_t>(
            "--rpc-id",
            [&options](const uint32_t& number) {
                options.rpcId = number;
                options.hasRpcId = true;
            },
            "Number of the exchange")
        ->option_text("N");
    command->add_option("--request-type", options.requestType,
                        "Type of the body of a request or update (default: what the body says)");
    command->add_option("--count", options.count, "Responses that a request expects (default: single)")
        ->check(CLI::IsMember({"none", "single", "multiple"}));
    command
        ->add_option(
            "--schema-version", options.schemaVersion,
            "Schema version of the body, which a request states (default there: the schema's default)")
        ->check(CLI::NonNegativeNumber);
    command->add_flag("--final", options.isFinal, "The last response of its exchange");
    command->add_option("--header", options.vHeaders, "One more header; may be given several times")
        ->option_text("NAME=VALUE")
        ->allow_extra_args(false);
    command->add_flag("--lines", options.lines, "The input has messages as unframe writes them, one a line");
}

/// Adds "sorn unframe".
void AddUnframe(CLI::App& app, sorn::tools::UnframeOptions& options) {
    CLI::App* command =
        app.add_subcommand("unframe", "Takes a stream of ORPC/2 messages apart: one JSON object a message");
    command->add_flag("--parse-body", options.parseBody,
                      "Read the bodies: refuse bad ones and write the others anew, sorted");
    command->add_option("IN", options.inPath, "Input file (default: standard input)")->option_text("IN");
}

void AddBus(CLI::App* command, std::string& bus, bool& trace) {
    command
        ->add_option(
            "--bus", bus,
            "Address of the bus (default: what SORN_BUS says, else sorn-bus in the folder of the session)")
        ->option_text("ADDRESS");
    command->add_flag("--trace", trace, "Show every message on standard error, as unframe does");
}

/// Adds "sorn send".
void AddSend(CLI::App& app, sorn::tools::SendOptions& options) {
    using sorn::tools::SendOptions;
    CLI::App* command =
        app.add_subcommand("send", "Sends a request to the service and shows what comes back");
    AddBus(command, options.bus, options.trace);
    CLI::Option_group* ways = command->add_option_group("ways");
    const auto addWay = [&](const char* name, SendOptions::Way way, const char* text) {
        ways->add_flag_callback(
            name, [&options, way] { options.way = way; }, text);
    };
    addWay("--wait", SendOptions::WAIT, "Wait for one response (the default)");
    addWay("--forget", SendOptions::FORGET, "Expect no response");
    addWay("--watch", SendOptions::WATCH, "Show all responses, until the last one or an interrupt");
    ways->require_option(0, 1);
    command->add_option("REQUEST", options.inPath, "File with the request's JSON (default: standard input)")
        ->option_text("REQUEST.json");
}

/// Adds "sorn put" or "sorn rm".
void AddPutOrRemove(CLI::App& app, const char* name, const char* text, const char* action,
                    sorn::tools::PutAndRemoveOptions& options) {
    CLI::App* command = app.add_subcommand(name, text);
    options.action = action;
    AddBus(command, options.bus, options.trace);
    command->add_option("IN", options.inPath, "File of records, one a line (default: standard input)")
        ->option_text("RECORDS.jsonl");
}

/// Adds "sorn serve".
void AddServe(CLI::App& app, sorn::tools::ServeOptions& options) {
    CLI::App* command = app.add_subcommand("serve", "Runs the development service until it is interrupted");
    command
        ->add_option("--bus", options.bus,
                     "Address of the bus (default: what SORN_BUS says, else sorn-bus in the folder of the "
                     "session)")
        ->option_text("ADDRESS");
    command->add_option("--db", options.database, "File that keeps the records (default: in memory)")
        ->option_text("FILE");
    command
        ->add_option("--load", options.vLoads,
                     "File of records to store at the start, one a line; may be given several times")
        ->option_text("FILE.jsonl")
        ->allow_extra_args(false);
    command->add_flag("--trace", options.trace, "Show every message on standard output, as unframe does");
}

int Run(int argc, char** argv) {
    CLI::App app{"The records of a digital video recorder platform: looks at their schema and converts them",
                 "sorn"};
    app.require_subcommand(1);
    app.set_help_all_flag("--help-all", "Help of all commands");
    sorn::tools::DescribeOptions describe;
    sorn::tools::ConvertOptions convert;
    AddDescribe(app, describe);
    sorn::tools::FrameOptions frame;
    sorn::tools::UnframeOptions unframe;
    AddConvert(app, convert);
    AddFrame(app, frame);
    AddUnframe(app, unframe);
    sorn::tools::SendOptions send;
    sorn::tools::PutAndRemoveOptions put;
    sorn::tools::PutAndRemoveOptions remove;
    AddSend(app, send);
    AddPutOrRemove(app, "put", "Stores records in the development service", "put", put);
    AddPutOrRemove(app, "rm",
                   "Removes the records that have all of the fields given from the development service",
                   "remove", remove);
    sorn::tools::ServeOptions serve;
    AddServe(app, serve);
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        return app.exit(error) == 0 ? sorn::tools::DONE : sorn::tools::WRONG_USAGE;
    }
    if (app.got_subcommand("describe")) return sorn::tools::Describe(describe);
    if (app.got_subcommand("frame")) return sorn::tools::Frame(frame);
    if (app.got_subcommand("send")) return sorn::tools::Send(send);
    if (app.got_subcommand("serve")) return sorn::tools::Serve(serve);
    if (app.got_subcommand("put")) return sorn::tools::PutOrRemove(put);
    if (app.got_subcommand("rm")) return sorn::tools::PutOrRemove(remove);
    if (app.got_subcommand("unframe")) return sorn::tools::Unframe(unframe);
    return sorn::tools::Convert(convert);
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
