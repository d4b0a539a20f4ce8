#!/usr/bin/env python3
"""A minimal gateway: takes every recognition request and answers with a fixed text.

It shows what docs/PROTOCOL.md asks of a gateway, with Python's standard library alone, and
recognises nothing. For the loopback interface only: no encryption, no authentication.
"""

import argparse
import base64
import http.server
import re
import urllib.parse
import uuid
from xml.sax.saxutils import escape

RECOGNITION_PATHS = ("/asrgw", "/asrgw_chunked")
LOG_PATH = "/log"
REQUIRED_FIELDS = ("uuid", "lang", "topic", "myll", "centerll")
MAX_BODY_BYTES = 16 * 1024 * 1024


class Refusal(Exception):
    """An answer other than 200: its status and its text."""


def parse_parts(body, content_type):
    """Returns the parts of a multipart body as a map from name to value, both in order."""
    boundary = re.fullmatch(r"multipart/form-data; boundary=(\S+)", content_type)
    if not boundary:
        raise Refusal(400, "the content type is not multipart/form-data with a boundary")
    separator = b"\r\n--" + boundary.group(1).encode()
    # Each part ends with CRLF. The first separator has none before it, so put one there.
    start, *pieces = (b"\r\n" + body).split(separator)
    if start or not pieces or pieces[-1] != b"--\r\n":
        raise Refusal(400, "the body does not begin or end with the boundary")
    parts = {}
    for piece in pieces[:-1]:
        head, gap, value = piece.partition(b"\r\n\r\n")
        name = re.search(rb'Content-Disposition: form-data; name="([^"]*)"', head)
        if not gap or not name:
            raise Refusal(400, "a part has no name")
        parts[name.group(1).decode()] = value
    return parts


def make_document(text):
    """The result document: one hypothesis, or none for the empty text."""
    variant = f'<variant confidence="1">{escape(text)}</variant>' if text else ""
    return (
        '<?xml version="1.0" encoding="utf-8"?>'
        f'<recognitionResults success="{len(text) and 1}">{variant}</recognitionResults>'
    )


class Gateway(http.server.BaseHTTPRequestHandler):
    protocol_version = "HTTP/1.1"  # keeps connections open between requests
    timeout = 60  # seconds without a byte; a user who is silent still sends sound
    answer_text = ""

    def do_POST(self):
        self.handle_request(self.recognise)

    def do_GET(self):
        self.handle_request(self.keep_record)

    def handle_request(self, work):
        path, _, rest = self.path.partition("?")
        # The client encodes nothing but the record, and a plus sign stands for itself.
        query = dict(pair.partition("=")[::2] for pair in rest.split("&"))
        headers = {}
        try:
            self.answer(200, work(path, query, headers), headers)
        except Refusal as refusal:
            self.close_connection = True  # the rest of the body may not have been read
            self.answer(*refusal.args, headers)
        except ValueError:  # what is not a number or not UTF-8
            self.close_connection = True
            self.answer(400, "the request is malformed", headers)
        except ConnectionError:
            self.close_connection = True

    def recognise(self, path, query, headers):
        if path not in RECOGNITION_PATHS:
            raise Refusal(404, "no such path")
        parts = parse_parts(self.read_body(), self.headers.get("Content-Type", ""))
        for name in REQUIRED_FIELDS:
            if not parts.get(name):
                raise Refusal(400, f"the field {name} is missing or empty")
        if parts["uuid"].decode() != query.get("uuid"):
            raise Refusal(400, "the uuid of the query and that of the body differ")
        sound = parts.get("audio", b"")
        codec = "Ogg Speex" if sound.startswith(b"OggS") else "PCM"
        fields = " ".join(f"{name}={parts[name].decode()}" for name in REQUIRED_FIELDS)
        print(f"{path} {fields} {codec} {len(sound)} bytes", flush=True)
        headers["x-kvrequestid"] = uuid.uuid4().hex
        if "transcripts" in parts or "canceled" in parts:
            return "nothing to recognise"
        document = make_document(self.answer_text)
        headers["x-asrgw-recognition-results"] = base64.b64encode(document.encode()).decode()
        return document

    def keep_record(self, path, query, headers):
        if path != LOG_PATH:
            raise Refusal(404, "no such path")
        if not query.get("logmessage"):
            raise Refusal(400, "there is no logmessage")
        record = urllib.parse.unquote_to_bytes(query["logmessage"])
        # A record may hold any bytes: print them escaped, on one line.
        print(f"{path} uuid={query.get('uuid')} {str(record)[2:-1]}", flush=True)
        return ""

    def read_body(self):
        if self.headers.get("Transfer-Encoding", "").lower() != "chunked":
            return self.read_exactly(int(self.headers.get("Content-Length", "0")), 0)
        body = bytearray()
        while True:
            size = int(self.rfile.readline(64).split(b";")[0] or b"0", 16)
            body += self.read_exactly(size, len(body))
            self.read_exactly(len(b"\r\n"), 0)
            if size == 0:
                return bytes(body)

    def read_exactly(self, size, so_far):
        if not 0 <= size <= MAX_BODY_BYTES - so_far:
            raise Refusal(413, f"the body is longer than {MAX_BODY_BYTES} bytes")
        piece = self.rfile.read(size)
        if len(piece) < size:
            raise ConnectionResetError("the client went away")
        return piece

    def answer(self, status, text, headers):
        body = (text + "\n").encode()
        self.send_response(status)
        self.send_header("Content-Type", "text/plain; charset=utf-8")
        self.send_header("Content-Length", str(len(body)))
        for name, value in headers.items():
            self.send_header(name, value)
        self.end_headers()
        self.wfile.write(body)


if __name__ == "__main__":
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("--port", type=int, default=8090, help="0 picks a free one")
    parser.add_argument("--text", default="hello world", help="the answer to every request")
    options = parser.parse_args()
    Gateway.answer_text = options.text
    server = http.server.ThreadingHTTPServer(("127.0.0.1", options.port), Gateway)
    print(f"listening on http://127.0.0.1:{server.server_port}", flush=True)
    server.serve_forever()
