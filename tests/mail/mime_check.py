#!/usr/bin/env python3
"""Parses a message file with Python's email package, as a mail program would, and prints
what it found as JSON: addresses, subject, body, the attachment and every defect the parser
reports."""

import base64
import email
import email.policy
import json
import sys


def addresses(message, name):
    header = message[name]
    if header is None:
        return None
    return [[a.display_name, a.addr_spec] for a in header.addresses]


def main():
    with open(sys.argv[1], "rb") as f:
        raw = f.read()
    message = email.message_from_bytes(raw, policy=email.policy.default)
    defects = []
    for part in message.walk():
        defects += [type(d).__name__ for d in part.defects]
        for name, value in part.items():
            defects += ["%s: %s" % (name, type(d).__name__) for d in getattr(value, "defects", [])]
    body = message.get_body(preferencelist=("plain",))
    attachments = list(message.iter_attachments()) if message.is_multipart() else []
    result = {
        "headers": list(message.keys()),
        "from": addresses(message, "From"),
        "to": addresses(message, "To"),
        "cc": addresses(message, "Cc"),
        "bcc": addresses(message, "Bcc"),
        "subject": str(message["Subject"]),
        "date": message["Date"].datetime.isoformat() if message["Date"] else None,
        "message_id": message["Message-ID"],
        "mime_version": message["MIME-Version"],
        # Line ends as a mail program shows them.
        "body": body.get_content().replace("\r\n", "\n") if body is not None else None,
        "body_charset": body.get_content_charset() if body is not None else None,
        "attachments": [{
            "filename": a.get_filename(),
            "content_type": a.get_content_type(),
            "data": base64.b64encode(a.get_payload(decode=True)).decode("ascii"),
        } for a in attachments],
        "defects": defects,
    }
    json.dump(result, sys.stdout)


if __name__ == "__main__":
    main()
