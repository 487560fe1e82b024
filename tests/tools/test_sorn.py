"""The sorn command from outside: what it prints, where, and what it exits with."""

import base64
import json
import os
import pty
import resource
import shlex
import subprocess
import tempfile
import time
import unittest
from pathlib import Path

from tools.command import DONE, ROOT, SOME_REFUSED, TOOL, WRONG_USAGE, run


class Usage(unittest.TestCase):
    def test_help_on_every_level(self):
        for arguments in (["--help"], *([each, "--help"] for each in ("describe", "convert", "frame", "unframe", "serve", "send", "put", "rm"))):
            code, out, err = run(*arguments)
            self.assertEqual((code, err), (DONE, b""), arguments)
            self.assertIn(b"Usage: sorn", out)

    def test_wrong_usage(self):
        for arguments in ([], ["nonsense"], ["convert", "--nonsense"], ["convert", "--from", "yaml"], ["convert", "--road", "long"],
                          ["convert", "--schema-version", "-1"], ["convert", "--schema-version", "x"],
                          ["describe", "Recording"], ["describe", "0"], ["describe", "130"], ["describe", "99999999999"],
                          ["describe", "-3"], ["convert", "/nowhere/in.json"], ["convert", "-o", "/nowhere/out.json"]):
            code, out, err = run(*arguments)
            self.assertEqual((code, out), (WRONG_USAGE, b""), arguments)
            self.assertNotEqual(err, b"", arguments)

    def test_help_of_all(self):
        code, out, _ = run("--help-all")
        self.assertEqual(code, DONE)
        for word in (b"describe", b"convert", b"--json", b"--lines", b"unframe", b"--rpc-id"):
            self.assertIn(word, out)

    def completions(self, *words):
        """What bash offers for the last of the words."""
        with tempfile.TemporaryDirectory() as folder:
            command = Path(folder, "sorn")
            command.write_text(f'#!/bin/sh\nexec {shlex.join(TOOL)} "$@"\n')
            command.chmod(0o755)
            script = f"""source {ROOT}/tools/completion/sorn.bash
                COMP_WORDS=({shlex.join([str(command), *words])}); COMP_CWORD={len(words)}
                _sorn; printf '%s\\n' "${{COMPREPLY[@]}}\""""
            done = subprocess.run(["bash", "-c", script], capture_output=True, check=True, text=True)
            self.assertEqual(done.stderr, "")
            return set(done.stdout.split())

    def test_completion(self):
        for command in ("describe", "convert", "frame", "unframe", "serve", "send", "put", "rm"):
            helped = run(command, "--help")[1].decode().replace(",", " ").split()
            options = {word for word in helped if word.startswith("--")}
            self.assertEqual(self.completions(command, "--"), options, command)
        self.assertEqual(self.completions("con"), {"convert"})
        self.assertEqual(self.completions("describe", "recordingS"), {"recordingSearch", "recordingSettings"})
        self.assertEqual(self.completions("convert", "--road", ""), {"dictionary", "typed"})
        self.assertEqual(self.completions("convert", "--to", ""), {"json", "binary"})
        self.assertEqual(self.completions("frame", "--count", ""), {"none", "single", "multiple"})
        self.assertEqual(self.completions("frame", "request"), {"request", "requestUpdate"})


class Describe(unittest.TestCase):
    def test_record(self):
        code, out, err = run("describe", "audioStream")
        self.assertEqual((code, err), (DONE, b""))
        lines = [line.split() for line in out.decode().splitlines()]
        self.assertEqual(lines[0], 'audioStream: record 2084, 8 slots, ids begin with "vuka:aus."'.split())
        self.assertEqual(lines[2], "1 audioStreamFormat enum audioStreamFormat optional 22-42".split())
        self.assertEqual(lines[3], "1 audioStreamFormat enum audioStreamFormat required 7-21 older form".split())
        self.assertEqual(run("describe", "2084")[1], out)

    def test_enumeration_with_a_hole(self):
        out = run("describe", "channelListType")[1].decode()
        self.assertEqual([line.split() for line in out.splitlines()],
                         ["channelListType: enumeration 681, values below 3".split(), ["1", "favorites"], ["2", "received"]])

    def test_list(self):
        lines = run("describe")[1].decode().splitlines()
        self.assertEqual(len(lines), 286 + 192)
        self.assertEqual(lines[0].split(), ["129", "record", "account"])
        self.assertIn(["702", "enumeration", "errorCode"], [line.split() for line in lines])

    def test_json_of_all(self):
        all_metadata = json.loads(run("describe", "--json")[1])
        self.assertEqual({key: all_metadata[key] for key in all_metadata if isinstance(all_metadata[key], int)},
                         {"firstSchemaVersion": 7, "lastSchemaVersion": 42, "defaultSchemaVersion": 42,
                          "nStructDef": 5919, "nEnumDef": 5801})
        self.assertEqual((len(all_metadata["structs"]), len(all_metadata["enums"])), (286, 192))
        self.assertEqual(len(all_metadata["structNameHashTable"]), 661)
        self.assertEqual(sum(1 for name in all_metadata["structNameHashTable"] if name is not None), 286)
        self.assertEqual(sum(len(struct["fields"]) for struct in all_metadata["structs"]), 2698)

    def test_json_of_one(self):
        hello = {"name": "orvoRpcHello", "id": 1449, "idPrefix": None, "nFields": 2, "fields": [
            {"slot": 1, "name": "identity", "dataType": 17, "arity": 2, "firstVersion": 7, "lastVersion": 42,
             "typeRef": 0, "variants": []}]}
        self.assertEqual(json.loads(run("describe", "--json", "orvoRpcHello")[1]), hello)
        remove = json.loads(run("describe", "--json", "localApplicationDataRemove")[1])
        key = [field for field in remove["fields"] if field["name"] == "key"][0]
        self.assertEqual((key["firstVersion"], key["lastVersion"]), (26, 42))
        self.assertEqual(key["variants"], [{"slot": 2, "name": "key", "dataType": 17, "arity": 2, "firstVersion": 7,
                                            "lastVersion": 25, "typeRef": 0, "variants": []}])
        self.assertEqual(json.loads(run("describe", "--json", "681")[1]),
                         {"id": 681, "name": "channelListType", "count": 3, "names": {"1": "favorites", "2": "received"}})


    def test_json_has_every_field_of_the_golden_dump(self):
        structs = {struct["name"]: struct for struct in json.loads(run("describe", "--json")[1])["structs"]}
        variants = {(name, field["name"]): (variant["firstVersion"], variant["lastVersion"], variant["arity"], variant["dataType"])
                    for name, struct in structs.items() for field in struct["fields"] for variant in field["variants"]}
        self.assertEqual(variants, {("audioStream", "audioStreamFormat"): (7, 21, 1, 7),
                                    ("audioStream", "audioStreamId"): (7, 21, 1, 9),
                                    ("localApplicationDataRemove", "key"): (7, 25, 2, 17),
                                    ("viewStartEvent", "timestampMilliseconds"): (7, 11, 0, 15),
                                    ("viewStopEvent", "timestampMilliseconds"): (7, 11, 0, 15)})

    def test_full_disk(self):
        for arguments in (["describe"], ["describe", "ad"], ["describe", "--json"]):
            with open("/dev/full", "wb") as full:
                done = subprocess.run([*TOOL, *arguments], stdout=full, stderr=subprocess.PIPE)
            self.assertEqual((done.returncode, done.stderr), (SOME_REFUSED, b"the output could not be written\n"), arguments)


class Convert(unittest.TestCase):
    def test_one_record(self):
        self.assertEqual(run("convert", text=b'{type:hostAndPort, port:"80", host:"a b"}'),
                         (DONE, b'{"host": "a b", "port": 80, "type": "hostAndPort"}\n', b""))

    def test_pretty(self):
        self.assertEqual(run("convert", "--pretty", text=b'{"type":"updateTemplate","fieldNumber":5}')[1],
                         b'{\n    "fieldNumber": 5, \n    "type": "updateTemplate"\n}\n')

    def test_refused_record(self):
        self.assertEqual(run("convert", text=b"[]"), (SOME_REFUSED, b"", b"JSON must start with '{'.\n"))

    def test_versions(self):
        text = b'{"type":"audioStream","audioStreamFormat":"nonsense"}'
        words = b"bad enum item nameCannot convert value for the field.. Bad single field: audioStreamFormat\n"
        self.assertEqual(run("convert", "--schema-version", "7", text=text), (SOME_REFUSED, b"", words))
        self.assertEqual(run("convert", "--schema-version", "7", text=b'{"type":"audioStream"}'),
                         (SOME_REFUSED, b"", b"Required field not set: audioStreamFormat\n"))
        self.assertEqual(run("convert", "--schema-version", "22", text=b'{"type":"audioStream"}'),
                         (DONE, b'{"type": "audioStream"}\n', b""))
        self.assertEqual(run("convert", "--schema-version", "43", text=b'{"type":"audioStream"}')[2],
                         b"Unmarshaling to SornObject: given orvo version is out of range used in code generation: \x2b\n")

    # hostAndPort is struct 2045: 2045 * 8 + 2 = 0x3FEA is EA 7F; 8 bytes of fields; "a b" in field 1; 80, zigzag 160, in field 2.
    BINARY = bytes.fromhex("EA7F 08 0A03612062 10A001")
    BASE64 = b"6n8ICgNhIGIQoAE=\n"
    SORTED = b'{"host": "a b", "port": 80, "type": "hostAndPort"}\n'
    SLOTS = b'{"host": "a b", "type": "hostAndPort", "port": 80}\n'

    def test_all_forms_and_roads(self):
        for road, text in (("typed", self.SLOTS), ("dictionary", self.SORTED)):
            for source, given in (("json", self.SORTED), ("json", self.SLOTS), ("binary", self.BINARY)):
                for target, expected in (("json", text), ("binary", self.BINARY)):
                    forms = ["convert", "--road", road, "--from", source, "--to", target]
                    self.assertEqual(run(*forms, text=given), (DONE, expected, b""), forms)
                    lines = self.BASE64 if source == "binary" else given
                    expected_line = self.BASE64 if target == "binary" else text
                    self.assertEqual(run(*forms, "--lines", text=lines * 2), (DONE, expected_line * 2, b""), forms)

    def test_pretty_is_the_dictionary_writers(self):
        pretty = b'{\n    "host": "a b", \n    "port": 80, \n    "type": "hostAndPort"\n}\n'
        for source, given in (("json", self.SLOTS), ("binary", self.BINARY)):
            self.assertEqual(run("convert", "--road", "typed", "--pretty", "--from", source, text=given), (DONE, pretty, b""))

    def test_refused_on_the_typed_road(self):
        for text, words in (
                (b"[]", b"JSON object does not start with '{'.\n"),
                (b"{}", b"the type of the record is missing, or names no struct\n"),
                (b'{"type": "nope"}', b"the type of the record is missing, or names no struct\n"),
                (b'{"type": "hostAndPort", "port": "x"}',
                 b" failed to UnmarshalOneSingleValue in ReadFieldValue Failed to parse value for key port\n")):
            self.assertEqual(run("convert", "--road", "typed", text=text), (SOME_REFUSED, b"", words), text)
        # No required field is asked for here, and what stands behind the record is not looked at.
        self.assertEqual(run("convert", "--road", "typed", text=b'{"type": "hostAndPort"} x')[:2],
                         (DONE, b'{"host": "", "type": "hostAndPort", "port": 0}\n'))

    def test_refused_binary_records(self):
        words = b"Protobuf did not unmarshal to SornObject\n"
        for given in (b"", b"\xEA", self.BINARY[:-1], self.BINARY + b"\0"):
            self.assertEqual(run("convert", "--from", "binary", text=given), (SOME_REFUSED, b"", words), given)
        given = self.BASE64 + b"6n8I=\n\n" + self.BASE64.replace(b"\n", b"\r\n") + b"6n8J\n"
        self.assertEqual(run("convert", "--from", "binary", "--lines", text=given),
                         (SOME_REFUSED, self.SORTED + b"\n\n" + self.SORTED + b"\n",
                          b"line 2: the line is not Base64\nline 3: " + words + b"line 5: " + words))
        self.assertEqual(run("convert", "--to", "binary", "--lines", text=self.SORTED + b"[]\n" + self.SORTED)[:2],
                         (SOME_REFUSED, self.BASE64 + b"\n" + self.BASE64))

    def test_unknown_fields_are_told_apart_from_the_records(self):
        given = bytes.fromhex("EA7F 0A 0A03612062 10A001 1801")  # field 3 is one that the struct has not
        words = b"field number '3' out of range in 'hostAndPort'\n"
        self.assertEqual(run("convert", "--from", "binary", text=given), (DONE, self.SORTED, words))
        with tempfile.TemporaryDirectory() as folder:
            target = Path(folder, "out.json")
            self.assertEqual(run("convert", "--from", "binary", "-o", str(target), text=given), (DONE, b"", words))
            self.assertEqual(target.read_bytes(), self.SORTED)
        # Told before what is said of the next line.
        lines = base64.b64encode(given) + b"\n!\n" + base64.b64encode(given) + b"\n"
        self.assertEqual(run("convert", "--from", "binary", "--lines", text=lines)[2],
                         words + b"line 2: the line is not Base64\n" + words)

    def test_a_record_is_one_line_whatever_its_bodies_are(self):
        # orvoRpcResponse is struct 976: 976 * 8 + 2 = 0x1E82 is 82 3D. Field 2, the body, is text with line feeds.
        body = b'{"type":\n"success"\n}'
        record = bytes.fromhex("823D") + bytes([len(body) + 2, 0x12, len(body)]) + body
        for road in ("typed", "dictionary"):
            code, out, err = run("convert", "--road", road, "--from", "binary", "--lines", text=base64.b64encode(record) * 1 + b"\n")
            self.assertEqual((code, err, out.count(b"\n")), (DONE, b"", 1), road)
            self.assertIn(b'{"type": "success" }', out)

    def test_versions_on_the_typed_road(self):
        text = b'{"type":"ttsSettings","enabled":true,"isFeatureEnabled":true}'
        for version, expected in (("0", b'{"enabled": true, "type": "ttsSettings", "isFeatureEnabled": true}\n'),
                                  ("7", b'{"type": "ttsSettings", "enabled": true}\n')):
            self.assertEqual(run("convert", "--road", "typed", "--schema-version", version, text=text), (DONE, expected, b""))
        for version in ("6", "43"):
            self.assertEqual(run("convert", "--road", "typed", "--schema-version", version, text=text),
                             (WRONG_USAGE, b"", b"--schema-version: the schema has the versions 7 to 42\n"))

    def test_older_version_there_and_back(self):
        text = b'{"audioStreamFormat": "ac3", "audioStreamId": "vuka:aus.7", "type": "audioStream"}\n'
        for version in ("0", "7", "21", "22", "42"):
            self.assertEqual(run("convert", "--road", "dictionary", "--schema-version", version, text=text), (DONE, text, b""))

    def test_deep_record_on_a_small_stack(self):
        depth = 100000
        head = b'{"cause": ' * depth
        inner = b'{"code": "badArgument", "text": "t", "type": "error"}'
        text = head + inner + b', "code": "badArgument", "text": "t", "type": "error"}' * depth + b"\n"
        small = lambda: resource.setrlimit(resource.RLIMIT_STACK, (256 * 1024, 256 * 1024))
        limit = {} if len(TOOL) > 1 else {"preexec_fn": small}  # an emulator needs a stack of its own
        done = subprocess.run([*TOOL, "convert"], input=text, capture_output=True, timeout=300, **limit)
        self.assertEqual((done.returncode, done.stdout == text, done.stderr), (DONE, True, b""))
        # And through the binary form by the typed road.
        forms = ["convert", "--road", "typed"]
        binary = subprocess.run([*TOOL, *forms, "--to", "binary"], input=text, capture_output=True, timeout=300, **limit)
        done = subprocess.run([*TOOL, "convert", "--from", "binary"], input=binary.stdout, capture_output=True, timeout=300, **limit)
        self.assertEqual((binary.returncode, done.returncode, done.stdout == text), (DONE, DONE, True))

    def test_lines_pretty(self):
        text = b'{"type":"success"}\n{"type":"success"}\n'
        self.assertEqual(run("convert", "--lines", "--pretty", text=text)[1], b'{\n    "type": "success"\n}\n' * 2)

    def test_lines_with_carriage_returns(self):
        self.assertEqual(run("convert", "--lines", text=b'{"type":"success"}\r\n'), (DONE, b'{"type": "success"}\n', b""))

    def test_lines_go_out_while_the_next_is_awaited(self):
        with subprocess.Popen([*TOOL, "convert", "--lines"], stdin=subprocess.PIPE, stdout=subprocess.PIPE, bufsize=0) as tool:
            for _ in range(2):
                tool.stdin.write(b'{"type":"success"}\n')
                self.assertEqual(tool.stdout.readline(), b'{"type": "success"}\n')

    def test_lines(self):
        text = b'{"type":"success"}\nnonsense\n{"type":"updateTemplate","fieldNumber":1}\n\n{"type":"success"}'
        code, out, err = run("convert", "--lines", text=text)
        self.assertEqual(code, SOME_REFUSED)
        self.assertEqual(out.split(b"\n"), [b'{"type": "success"}', b"", b'{"fieldNumber": 1, "type": "updateTemplate"}', b"",
                                            b'{"type": "success"}', b""])
        self.assertEqual(err, b"line 2: JSON must start with '{'.\nline 4: JSON must start with '{'.\n")
        self.assertEqual(run("convert", "--lines", text=b""), (DONE, b"", b""))

    def test_lines_longer_than_a_piece(self):
        title = b"x" * 200000
        record = b'{"fieldName": "' + title + b'", "type": "responseTemplateFieldInfo"}\n'
        self.assertEqual(run("convert", "--lines", text=record * 3), (DONE, record * 3, b""))

    def test_files(self):
        with tempfile.TemporaryDirectory() as folder:
            source, target = Path(folder, "in.json"), Path(folder, "out.json")
            source.write_bytes(b'{"type":"success"}')
            self.assertEqual(run("convert", "-o", str(target), str(source)), (DONE, b"", b""))
            self.assertEqual(target.read_bytes(), b'{"type": "success"}\n')
            self.assertEqual(run("convert", folder)[0], SOME_REFUSED)

    def test_output_onto_the_input(self):
        with tempfile.TemporaryDirectory() as folder:
            file = Path(folder, "in.json")
            file.write_bytes(b'{"type":"success"}')
            code, _, err = run("convert", "-o", str(file), str(file))
            self.assertEqual((code, err), (WRONG_USAGE, f"{file}: is the input, too\n".encode()))
            self.assertEqual(file.read_bytes(), b'{"type":"success"}')

    def test_full_disk(self):
        words = b"the output could not be written\n"
        code, _, err = run("convert", "-o", "/dev/full", text=b'{"type":"success"}')
        self.assertEqual(code, SOME_REFUSED)
        self.assertIn(words, err)
        with open("/dev/full", "wb") as full:
            done = subprocess.run([*TOOL, "convert", "--lines"], input=b'{"type":"success"}\n' * 3, stdout=full,
                                  stderr=subprocess.PIPE)
        self.assertEqual((done.returncode, done.stderr), (SOME_REFUSED, words))

    def test_examples_come_back_unchanged(self):
        files = sorted((ROOT / "examples/data").glob("*.jsonl"))
        records = 0
        types = set()
        for file in files:
            text = file.read_bytes()
            code, out, err = run("convert", "--lines", "--schema-version", "42", str(file))
            self.assertEqual((code, err), (DONE, b""), file.name)
            self.assertEqual(out, text, file.name)
            records += text.count(b"\n")
            types |= {json.loads(line)["type"] for line in text.splitlines()}
        self.assertGreaterEqual(records, 200)
        self.assertGreaterEqual(len(types), 15)

    def shown_on_terminal(self, text):
        """What the tool shows on a terminal while it works on the text for more than a second; and its output."""
        with tempfile.NamedTemporaryFile() as file:
            file.write(text)
            file.flush()
            leader, follower = pty.openpty()
            with subprocess.Popen([*TOOL, "convert", "--lines", file.name], stdout=subprocess.PIPE, stderr=follower) as tool:
                os.close(follower)
                first = tool.stdout.read(1)
                time.sleep(1.5)  # the pipe is full and the tool waits: its work takes more than a second
                out = first + tool.stdout.read()
            shown = b""
            try:
                while piece := os.read(leader, 65536):
                    shown += piece
            except OSError:  # a terminal ends so when its last writer is gone
                pass
            os.close(leader)
            return shown, out

    def test_progress_only_on_a_terminal(self):
        line = b'{"fieldName": "' + b"x" * 1000 + b'", "type": "responseTemplateFieldInfo"}\n'
        shown, out = self.shown_on_terminal(line * 1000)
        self.assertEqual(out, line * 1000)
        self.assertRegex(shown, rb"^\r\[#*\.*\] +[0-9]+ %")
        self.assertTrue(shown.endswith(b"\r\x1b[K"), shown[-80:])
        self.assertEqual(run("convert", "--lines", text=line * 1000)[2], b"")

    def test_words_stand_behind_a_cleared_bar(self):
        line = b'{"fieldName": "' + b"x" * 1000 + b'", "type": "responseTemplateFieldInfo"}\n'
        shown, _ = self.shown_on_terminal(line * 900 + b"[]\n" + line)
        self.assertIn(b"%\r\x1b[Kline 901: JSON must start with '{'.\r\n", shown)


if __name__ == "__main__":
    unittest.main()
