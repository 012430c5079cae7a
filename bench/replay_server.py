#!/usr/bin/env python3
"""Answers each request as the hosting server that is named (host:port) answered it the first time, without that one's
work, so that what a client does with the answer can be told from it."""

import http.server
import sys
import urllib.request

answers = {}


class Handler(http.server.BaseHTTPRequestHandler):
    def do_POST(self):
        body = self.rfile.read(int(self.headers["Content-Length"]))
        key = (self.path, body)
        if key not in answers:
            with urllib.request.urlopen(f"http://{sys.argv[1]}{self.path}", body) as answer:
                answers[key] = answer.read()
        self.send_response(200)
        self.send_header("Content-Type", "application/x-www-form-urlencoded; charset=utf-8")
        self.send_header("Content-Length", str(len(answers[key])))
        self.end_headers()
        self.wfile.write(answers[key])

    def log_message(self, *_):
        pass


server = http.server.ThreadingHTTPServer(("127.0.0.1", 0), Handler)
print(f"listening on 127.0.0.1:{server.server_port}", flush=True)
server.serve_forever()
