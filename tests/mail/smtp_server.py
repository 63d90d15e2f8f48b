#!/usr/bin/env python3
"""A loopback SMTP server for the mail tests.

Listens on 127.0.0.1 on a free port, prints the port on a line of its own and serves until it
is killed. Every accepted message is saved as N.eml (the bytes as received) with N.json (the
envelope: sender and recipients) in the output folder. Recipients whose address starts with
the refuse prefix are refused with 550; with --user and --password every mail needs that login.
"""

import argparse
import asyncio
import json
import os

from aiosmtpd.smtp import SMTP, AuthResult, LoginPassword


class Handler:
    def __init__(self, output, refuse_prefix):
        self.output = output
        self.refuse_prefix = refuse_prefix.lower()
        self.count = 0

    async def handle_RCPT(self, server, session, envelope, address, rcpt_options):
        if self.refuse_prefix and address.lower().startswith(self.refuse_prefix):
            return "550 5.1.1 <%s>: Recipient address rejected: no such user" % address
        envelope.rcpt_tos.append(address)
        return "250 2.1.5 OK"

    async def handle_DATA(self, server, session, envelope):
        self.count += 1
        base = os.path.join(self.output, str(self.count))
        with open(base + ".eml.tmp", "wb") as f:
            f.write(envelope.original_content)
        os.rename(base + ".eml.tmp", base + ".eml")
        with open(base + ".json.tmp", "w") as f:
            json.dump({"mail_from": envelope.mail_from, "rcpt_tos": envelope.rcpt_tos}, f)
        os.rename(base + ".json.tmp", base + ".json")
        return "250 2.0.0 Message accepted for delivery"


def authenticator(user, password):
    def check(server, session, envelope, mechanism, auth_data):
        ok = (isinstance(auth_data, LoginPassword)
              and auth_data.login == user.encode()
              and auth_data.password == password.encode())
        return AuthResult(success=ok, handled=False)
    return check


async def main():
    parser = argparse.ArgumentParser()
    parser.add_argument("--output", required=True)
    parser.add_argument("--refuse", default="")
    parser.add_argument("--user", default="")
    parser.add_argument("--password", default="")
    args = parser.parse_args()

    handler = Handler(args.output, args.refuse)
    options = {}
    if args.user:
        options = dict(authenticator=authenticator(args.user, args.password),
                       auth_required=True, auth_require_tls=False)
    loop = asyncio.get_running_loop()
    server = await loop.create_server(lambda: SMTP(handler, **options), "127.0.0.1", 0)
    print(server.sockets[0].getsockname()[1], flush=True)
    await server.serve_forever()


if __name__ == "__main__":
    asyncio.run(main())
