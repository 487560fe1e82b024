"""sorn frame and sorn unframe: messages made, taken apart, and put together again."""

import json
import os
import subprocess
import unittest

from tools.command import DONE, SOME_REFUSED, TOOL, WRONG_USAGE, run

BODY = b'{"type":"recordingSearch","bodyId":"-"}'  # 39 bytes


def message(*lines, body=b""):
    """A message by hand: its first line counted from the parts."""
    block = b"".join(line + b"\r\n" for line in lines) + b"\r\n"
    return b"ORPC/2 %d %d\r\n" % (len(block), len(body)) + block + body


REQUEST = message(b"Content-Type: application/json", b"RequestType: recordingSearch", b"ResponseCount: single", b"RpcId: 7",
                  b"SchemaVersion: 42", b"Type: request", body=BODY)
UPDATE = message(b"Content-Type: application/json", b"RequestType: recordingSearch", b"ResponseCount: multiple", b"RpcId: 7",
                 b"SchemaVersion: 0", b"Type: requestUpdate", body=BODY)
RESPONSE = message(b"Accept: x", b"Content-Type: application/json", b"IsFinal: true", b"RpcId: 4294967295", b"Type: response",
                   b"a: 1", b"a: 2", body=BODY)
CANCEL = b"ORPC/2 26 0\r\nRpcId: 7\r\nType: cancel\r\n\r\n"


class Frame(unittest.TestCase):
    def test_every_kind(self):
        self.assertTrue(REQUEST.startswith(b"ORPC/2 131 39\r\n"))
        for arguments, expected in (
            (["request", "--rpc-id", "7", "--request-type", "recordingSearch", "--count", "single", "--schema-version", "42"], REQUEST),
            (["request", "--rpc-id", "7"], REQUEST),  # type from the body, one response, the schema's version
            (["requestUpdate", "--rpc-id", "7"], UPDATE),
            (["requestUpdate", "--rpc-id", "7", "--count", "multiple", "--request-type", "recordingSearch"], UPDATE),
            (["response", "--rpc-id", "4294967295", "--final", "--header", "a=1", "--header", "Accept=x", "--header", "a=2"], RESPONSE),
            (["cancel", "--rpc-id", "7"], CANCEL),
        ):
            self.assertEqual(run("frame", *arguments, text=BODY), (DONE, expected, b""), arguments)

    def test_counts_and_versions(self):
        for count in (b"none", b"single", b"multiple"):
            out = run("frame", "request", "--rpc-id", "1", "--count", count.decode(), "--schema-version", "12", text=BODY)[1]
            self.assertIn(b"\r\nResponseCount: " + count + b"\r\n", out)
            self.assertIn(b"\r\nSchemaVersion: 12\r\n", out)

    def test_a_file_ends_with_a_line_end_and_the_body_does_not(self):
        self.assertEqual(run("frame", "request", "--rpc-id", "7", text=b"\n " + BODY + b"\r\n")[1], REQUEST)

    def test_refused_bodies(self):
        for text, words in ((b"", b"the body does not open with a brace\n"), (b"[1]", b"the body does not open with a brace\n"),
                            (b"{}", b"the body has no type; --request-type gives one\n")):
            self.assertEqual(run("frame", "request", "--rpc-id", "1", text=text), (SOME_REFUSED, b"", words), text)

    def test_a_type_cannot_add_headers(self):
        words = b"the type of the body is not on one line\n"
        for kind in ("request", "requestUpdate"):
            self.assertEqual(run("frame", kind, "--rpc-id", "7", text=b'{"type":"x\\r\\nRpcId: 9"}'), (SOME_REFUSED, b"", words))
            self.assertEqual(run("frame", kind, "--rpc-id", "7", "--request-type", "x\r\nRpcId: 9", text=BODY), (SOME_REFUSED, b"", words))

    def test_largest_body(self):
        body = b'{"a":"%s"}' % (b"x" * (0x500000 - 8))
        code, out, _ = run("frame", "response", "--rpc-id", "1", text=body)
        self.assertEqual((code, len(out)), (DONE, len(b"ORPC/2 76 5242880\r\n") + 76 + 0x500000))
        self.assertEqual(run("frame", "response", "--rpc-id", "1", text=body[:-2] + b'x"}'),
                         (SOME_REFUSED, b"", b"Orvo Rpc message body is too large.\n"))

    def test_wrong_usage(self):
        for arguments in (["--rpc-id", "1"], ["request"], ["nonsense", "--rpc-id", "1"], ["request", "--rpc-id", "x"],
                          ["request", "--rpc-id", "4294967296"], ["request", "--rpc-id", "-1"],
                          ["request", "--rpc-id", "1", "--count", "two"], ["response", "--rpc-id", "1", "--count", "none"],
                          ["requestUpdate", "--rpc-id", "1", "--count", "none"], ["request", "--rpc-id", "1", "--final"],
                          ["response", "--rpc-id", "1", "--request-type", "x"], ["cancel", "--rpc-id", "1", "--header", "a=b"],
                          ["cancel", "--rpc-id", "1", "--schema-version", "7"], ["request", "--rpc-id", "1", "/nowhere/in.json"],
                          ["request", "--rpc-id", "1", "--lines"]):
            code, out, err = run("frame", *arguments, text=BODY)
            self.assertEqual((code, out), (WRONG_USAGE, b""), arguments)
            self.assertNotEqual(err, b"", arguments)

    def test_headers_that_cannot_be(self):
        for header, words in (("RpcId=1", b"reserved"), ("Type=x", b"reserved"), ("novalue", b"NAME=VALUE"), ("=x", b"NAME=VALUE"),
                              ("a=x\r\nRpcId: 2", b"NAME=VALUE"), ("a:b=x", b"NAME=VALUE")):
            code, out, err = run("frame", "request", "--rpc-id", "1", "--header", header, text=BODY)
            self.assertEqual((code, out), (SOME_REFUSED, b""), header)
            self.assertIn(words, err)


class Unframe(unittest.TestCase):
    def unframed(self, stream, *arguments):
        code, out, err = run("unframe", *arguments, text=stream)
        return code, [json.loads(line) for line in out.splitlines()], err

    def test_every_kind(self):
        code, lines, err = self.unframed(REQUEST + UPDATE + RESPONSE + CANCEL)
        body = {"type": "recordingSearch", "bodyId": "-"}
        request = {"kind": "request", "rpcId": 7, "schemaVersion": 42, "requestType": "recordingSearch", "responseCount": "single",
                   "contentType": "application/json", "headers": {}, "body": body}
        self.assertEqual((code, err), (DONE, b""))
        self.assertEqual(lines, [
            request,
            {**request, "kind": "requestUpdate", "schemaVersion": 0, "responseCount": "multiple"},
            {"kind": "response", "rpcId": 4294967295, "isFinal": True, "contentType": "application/json",
             "headers": {"Accept": "x", "a": ["1", "2"]}, "body": body},
            {"kind": "cancel", "rpcId": 7},
        ])
        self.assertEqual(list(lines[0]), ["kind", "rpcId", "schemaVersion", "requestType", "responseCount", "contentType", "headers", "body"])

    def test_put_together_again(self):
        odd = [message(b"Content-Type: application/json", b"IsFinal: false", b"RpcId: 0", b"Type: response", b"x: \"\\\x01", body=body)
               for body in (b'{"a": 1 ,\r\n"a":"\\u00e9\\n"}', b'{"broken', b"{bare}", b' {}', b'{"a":"\xff"}', b'{"a":"\\\\u0041')]
        # A version is 32 bits without a sign, and a name of a type may hold any character.
        odd += [REQUEST.replace(b"SchemaVersion: 42", b"SchemaVersion: %d" % version).replace(b"ORPC/2 131", b"ORPC/2 139")
                for version in (2147483648, 4294967295)]
        odd += [REQUEST.replace(b"recordingSearch\r", b"recording\x00Sear\"\r")]
        stream = b"".join([REQUEST, UPDATE, *odd, RESPONSE, CANCEL])
        code, lines, err = run("unframe", text=stream)
        self.assertEqual((code, err, lines.count(b"\n")), (DONE, b"", 13))
        self.assertEqual(run("frame", "--lines", text=lines), (DONE, stream, b""))

    def test_lines_of_other_writers(self):
        line = json.dumps({"body": {"type": "x", "t": "}\"]"}, "headers": {"h": "\u00e9\u20ac\U0001f600/"}, "isFinal": False,
                           "contentType": "application/json", "rpcId": 3, "kind": "response"}).replace("/", "\\/")
        expected = message(b"Content-Type: application/json", b"IsFinal: false", b"RpcId: 3", b"Type: response",
                           "h: \u00e9\u20ac\U0001f600/".encode(), body=b'{"type": "x", "t": "}\\"]"}')
        self.assertEqual(run("frame", "--lines", text=line.encode()), (DONE, expected, b""))

    def test_refused_lines(self):
        good = b'{"kind":"cancel","rpcId":7}\n'
        for line, words in (
            (b"", b"the line is no JSON object"), (b"[]", b"the line is no JSON object"), (b"{}", b"kind is no string"),
            (b'{"kind":"cancel"', b"the line is no JSON object"), (b'{"kind":"cancel"} x', b"the line is no JSON object"),
            (b'{"kind":"cancel"}', b"rpcId is no number"), (b'{"kind":"cancel","rpcId":-1}', b"rpcId is no number"),
            (b'{"kind":"cancel","rpcId":4294967296}', b"rpcId is no number"), (b'{"kind":"hello","rpcId":1}', b"kind is none of"),
            (b'{"kind":"response","rpcId":1,"isFinal":1,"contentType":"","headers":{},"body":{}}', b"isFinal is no bool"),
            (b'{"kind":"response","rpcId":1,"isFinal":true,"contentType":"","headers":{"a":1},"body":{}}', b"headers is no object of strings"),
            (b'{"kind":"response","rpcId":1,"isFinal":true,"contentType":"","headers":{}}', b"body is missing"),
            (b'{"kind":"response","rpcId":1,"isFinal":true,"contentType":"","headers":{"RpcId":"2"},"body":{}}', b'a header is reserved, or none on one line: "RpcId"'),
            (b'{"kind":"response","rpcId":1,"isFinal":true,"contentType":"","headers":{"a:b":"c"},"body":{}}', b'a header is reserved, or none on one line: "a:b"'),
            (b'{"kind":"response","rpcId":1,"isFinal":true,"contentType":"","headers":{"a\\r\\nb":"c"},"body":{}}', b"a header is reserved, or none on one line: "),
            (b'{"kind":"response","rpcId":1,"isFinal":true,"contentType":"","headers":{"a":["b","c\\r\\nRpcId: 2"]},"body":{}}', b'a header is reserved, or none on one line: "a"'),
            (b'{"kind":"response","rpcId":1,"isFinal":true,"contentType":"\\r\\n","headers":{},"body":{}}', b"contentType is not on one line"),
            (b'{"kind":"requestUpdate","rpcId":1,"requestType":"x\\r\\ny","headers":{},"body":{}}', b"requestType is not on one line"),
            (b'{"kind":"response","rpcId":1,"isFinal":true,"contentType":"","headers":{},"body":[]}', b"the body does not open"),
            (b'{"kind":"response","rpcId":1,"isFinal":true,"contentType":"\\ud800","headers":{},"body":{}}', b"contentType is no string"),
        ):
            code, out, err = run("frame", "--lines", text=good + line + b"\n" + good)
            self.assertEqual((code, out), (SOME_REFUSED, CANCEL * 2), line)
            self.assertTrue(err.startswith(b"line 2: " + words), (line, err))

    def test_parsed_bodies(self):
        pretty = message(b"RpcId: 1", b"Type: response", body=b'{"b":1,\n"a":2}')
        code, out, _ = run("unframe", "--parse-body", text=pretty)
        self.assertEqual((code, out), (DONE, b'{"kind":"response","rpcId":1,"isFinal":false,"contentType":"","headers":{},"body":{"a": 2, "b": 1}}\n'))
        broken = message(b"RpcId: 1", b"Type: response", body=b'{"b"')
        self.assertEqual(run("unframe", "--parse-body", text=broken + CANCEL),
                         (SOME_REFUSED, b'{"kind":"cancel","rpcId":7}\n',
                          b"byte 0: Cannot convert JSON to Dict: JSON field name must be followed by a colon.\n"))

    def test_bad_messages_among_good_ones(self):
        cancelled = b'{"kind":"cancel","rpcId":7}\n'
        n = len(CANCEL)
        for stream, out, words in (
            (CANCEL + b"ORPC/2 14 0\r\nType: cancel\r\n" + CANCEL, cancelled * 2, b"byte %d: Missing rpcId\n" % n),
            (CANCEL + b"x" * 26 + CANCEL, cancelled * 2,
             b"byte %d: First line of message does not start with 'ORPC/2'; 26 bytes left out\n" % n),
            (b"ORPC/2 x 0\r\nORPC/2 y" + CANCEL, cancelled,
             b"byte 0: Invalid header length - not a number; 12 bytes left out\n"
             b"byte 12: First line does not have expected number of fields (3); 8 bytes left out\n"),
            (b"y" * 26, b"", b"byte 0: First line too long; 26 bytes left out\n"),
            (CANCEL + CANCEL[:-1], cancelled, b"byte %d: the message is not complete\n" % n),
            (CANCEL[:5], b"", b"byte 0: the message is not complete\n"),
            (CANCEL + b"z" * 200000 + CANCEL, cancelled * 2, b"byte %d: First line too long; 200000 bytes left out\n" % n),
        ):
            self.assertEqual(run("unframe", text=stream), (SOME_REFUSED, out, words), stream[:100])
        self.assertEqual(run("unframe"), (DONE, b"", b""))
        self.assertEqual(run("unframe", "/nowhere/in")[0], WRONG_USAGE)

    def test_blanks_that_other_readers_refuse(self):
        stream = b"".join(message(b"Content-Type: application/json", b"IsFinal: false", b"RpcId: 1", b"Type: response", body=body)
                          for body in (b'{\x0b"a":[1\x0c]}', b'{"a":[1]}\x0c', b' \x0b{"a":[1]}'))
        code, lines, _ = self.unframed(stream)
        self.assertEqual((code, [line["body"] for line in lines]), (DONE, [{"a": [1]}] * 3))
        self.assertEqual(run("frame", "--lines", text=run("unframe", text=stream)[1]), (DONE, stream, b""))

    def test_unknown_fields_of_a_binary_body_are_told_on_standard_error(self):
        body = b"\xea\x7f\x02\x20\x01"  # struct 2045, 2 bytes of fields: number 4, which it does not have, is 1
        code, lines, err = self.unframed(message(b"RpcId: 1", b"Type: response", body=body) + CANCEL)
        self.assertEqual((code, [line["kind"] for line in lines]), (DONE, ["response", "cancel"]))
        self.assertEqual(lines[0]["body"], {"host": "", "port": 0, "type": "hostAndPort"})
        self.assertEqual(set(err.splitlines()), {b"field number '4' out of range in 'hostAndPort'"})

    def test_junk_is_not_kept(self):
        junk = b"z" * (1 << 20)
        with subprocess.Popen([*TOOL, "unframe"], stdin=subprocess.PIPE, stdout=subprocess.PIPE, stderr=subprocess.PIPE) as tool:
            for _ in range(400):
                tool.stdin.write(junk)
            tool.stdin.write(CANCEL)
            tool.stdin.close()
            self.assertEqual(tool.stdout.read(), b'{"kind":"cancel","rpcId":7}\n')
            self.assertEqual(tool.stderr.read(), b"byte 0: First line too long; %d bytes left out\n" % (400 << 20))
            _, status, usage = os.wait4(tool.pid, 0)
            tool.returncode = os.waitstatus_to_exitcode(status)
        self.assertEqual(tool.returncode, SOME_REFUSED)
        self.assertLess(usage.ru_maxrss, 300 << 10)  # KiB

    def test_messages_go_out_as_they_come(self):
        with subprocess.Popen([*TOOL, "unframe"], stdin=subprocess.PIPE, stdout=subprocess.PIPE) as tool:
            for piece in (REQUEST[:3], REQUEST[3:50], REQUEST[50:] + CANCEL[:1]):
                tool.stdin.write(piece)
                tool.stdin.flush()
            self.assertEqual(json.loads(tool.stdout.readline())["kind"], "request")
            tool.stdin.write(CANCEL[1:])
            tool.stdin.flush()
            self.assertEqual(json.loads(tool.stdout.readline())["kind"], "cancel")
            tool.stdin.close()
            self.assertEqual(tool.wait(60), DONE)


if __name__ == "__main__":
    unittest.main()
