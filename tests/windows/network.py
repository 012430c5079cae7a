#!/usr/bin/python3
"""What tests need of the network beside the hosting server.

    network.py relay ADDRESS TARGET FILE    passes connections on to TARGET, and keeps the bytes of both ways in FILE
    network.py found FILE TEXT...           prints which of the texts, or bytes of files ("@PATH"), are in FILE
    network.py answer ADDRESS VERSION CERTIFICATE KEY BODY
                                            a service over that version of TLS, with one answer to every request

Servers take any free port and print "listening on ADDRESS:PORT".
"""

import http.server
import pathlib
import socketserver
import socket
import ssl
import sys
import threading


def serve(server):
    print("listening on %s:%d" % server.server_address, flush=True)
    server.serve_forever()


def relay(address, target, path):
    host, port = target.rsplit(":", 1)
    record = open(path, "wb", buffering=0)

    def copy(source, sink):
        try:
            while block := source.recv(65536):
                # One call, so that the other threads' bytes are not among them.
                record.write(block)
                sink.sendall(block)
            sink.shutdown(socket.SHUT_WR)
        except OSError:
            # The one end hears that the other has gone.
            for end in (source, sink):
                end.close()

    class Handler(socketserver.BaseRequestHandler):
        def handle(self):
            with socket.create_connection((host, int(port))) as other:
                answers = threading.Thread(target=copy, args=(other, self.request))
                answers.start()
                copy(self.request, other)
                answers.join()

    socketserver.ThreadingTCPServer.daemon_threads = True
    serve(socketserver.ThreadingTCPServer((address, 0), Handler))


def found(path, *texts):
    record = pathlib.Path(path).read_bytes()
    for text in texts:
        # Of a picture, bytes that no other one has, and that arrive in one piece.
        piece = pathlib.Path(text[1:]).read_bytes()[500:600] if text.startswith("@") else text.encode()
        if piece in record:
            print(text)


def answer(address, version, certificate, key, body):
    class Handler(http.server.BaseHTTPRequestHandler):
        def do_POST(self):
            self.rfile.read(int(self.headers["Content-Length"]))
            self.send_response(200)
            self.send_header("Content-Length", str(len(body)))
            self.end_headers()
            self.wfile.write(body.encode())

    context = ssl.SSLContext(ssl.PROTOCOL_TLS_SERVER)
    # Old versions need what the default level refuses.
    context.set_ciphers("DEFAULT:@SECLEVEL=0")
    context.minimum_version = context.maximum_version = ssl.TLSVersion[version]
    context.load_cert_chain(certificate, key)
    server = http.server.ThreadingHTTPServer((address, 0), Handler)
    server.socket = context.wrap_socket(server.socket, server_side=True)
    serve(server)


{"relay": relay, "found": found, "answer": answer}[sys.argv[1]](*sys.argv[2:])
