"""The client against a stand-in server: framing, error answers, events, handles."""

import datetime
import decimal
import gc
import json
import os
import sys
import unittest

from ludmox import EMPTY, Client, ComError

FAKE_SERVER = os.path.join(os.path.dirname(os.path.abspath(__file__)), "fake_ludmoxd.py")

METHOD_NOT_FOUND = -32601
INVALID_PARAMS = -32602
COMPONENT_ERROR = -32000
MEMBER_NOT_FOUND = -2147352573  # 0x80020003
TYPE_MISMATCH = -2147352571  # 0x80020005
OPEN_REPORT_FAILED = -2147191159  # 0x80047689


class FakeServerCase(unittest.TestCase):
    def setUp(self):
        self.mox = Client(sys.executable, [FAKE_SERVER])
        self.addCleanup(self.mox.close)
        self.widget = self.mox.create("Widget")

    def received(self):
        """What the server read so far, one parsed message per line."""
        lines = json.loads(self.widget.Received())
        return [json.loads(line) for line in lines]

    def refs(self, handle):
        """The server's references to a handle, asked through another object."""
        return self.widget.Refs(handle)


class ErrorAnswerTest(FakeServerCase):
    def test_error_answers_raise_with_number_source_and_description(self):
        cases = [
            # name, call, code, number, source, description, blamed argument
            ("component error", lambda w: w.Fail(), COMPONENT_ERROR, OPEN_REPORT_FAILED,
             "Widget.Fail", "Cannot open the report file.", None),
            ("argument of the wrong type", lambda w: w.Typed("three"), INVALID_PARAMS,
             TYPE_MISMATCH, "ludmoxd", "Type mismatch", 0),
            ("member the class does not have", lambda w: w.invoke("Nope"), INVALID_PARAMS,
             MEMBER_NOT_FOUND, "ludmoxd", "Unknown name", None),
            ("class that cannot be created", lambda w: self.mox.create("Gadget"),
             INVALID_PARAMS, MEMBER_NOT_FOUND, "ludmoxd", "Unknown class", None),
            # Without error data the JSON-RPC code and message stand in.
            ("method the server does not know", lambda w: self.mox._request("bogus", {}),
             METHOD_NOT_FOUND, METHOD_NOT_FOUND, "", "Method not found", None),
        ]
        for name, call, code, number, source, description, argument in cases:
            with self.subTest(name):
                with self.assertRaises(ComError) as caught:
                    call(self.widget)
                error = caught.exception
                self.assertEqual(
                    (error.code, error.number, error.source, error.description),
                    (code, number, source, description))
                self.assertEqual(str(error), f"{number}, {source}, {description}")
                self.assertEqual((error.data or {}).get("argument"), argument)
                # The conversation goes on after an error answer.
                self.assertEqual(self.widget.Typed(3), EMPTY)

    def test_member_outside_the_type_library_is_refused_before_sending(self):
        sent = len(self.received())
        with self.assertRaises(AttributeError):
            self.widget.NoSuchMember
        # Only the Received call itself went out.
        self.assertEqual(len(self.received()), sent + 1)


class FramingTest(FakeServerCase):
    def test_every_request_is_one_ascii_line(self):
        text = "Grüße\u2028zwei\nline"
        self.widget.Name = text
        lines = json.loads(self.widget.Received())
        for line in lines:
            self.assertTrue(line.endswith("\n"))
            self.assertEqual(line.count("\n"), 1)
            self.assertTrue(line.isascii(), line)
        puts = [m for m in map(json.loads, lines) if m["params"].get("kind") == "put"]
        self.assertEqual(puts[0]["params"], {"object": self.widget.handle, "member": "Name",
                                         "kind": "put", "args": [text]})

    def test_request_ids_are_unique(self):
        self.widget.Typed(1)
        self.widget.Typed(2)
        ids = [m["id"] for m in self.received() if "id" in m]
        self.assertEqual(len(ids), len(set(ids)))

    def test_answer_in_utf8_with_a_line_separator_is_read_whole(self):
        self.assertEqual(self.widget.Name, "Grüße\u2028zwei")

    def test_by_reference_results_come_back_in_order(self):
        result, args = self.widget.invoke_full("Swap", decimal.Decimal("1.5000"),
                                               datetime.datetime(2026, 12, 6, 14, 30))
        self.assertIsNone(result)  # a procedure
        self.assertEqual(args, [datetime.datetime(2026, 12, 6, 14, 30),
                                decimal.Decimal("1.5000")])

    def test_server_that_ends_without_answering_raises_connection_error(self):
        with self.assertRaises(ConnectionError):
            self.widget.Die()
        self.assertEqual(self.mox.close(), 3)
        with self.assertRaises(ConnectionError):
            self.widget.Typed(1)


class HandleTest(FakeServerCase):
    def test_same_handle_gives_the_same_proxy(self):
        self.assertIs(self.widget.Same(), self.widget)
        other = self.widget.Other()
        self.assertIsNot(other, self.widget)
        self.assertNotEqual(other.handle, self.widget.handle)
        self.assertIs(other.Same(), other)

    def test_collected_proxy_gives_back_every_reference_it_got(self):
        other = self.widget.Other()
        other.Same()
        other.Same()
        handle = other.handle
        self.assertEqual(self.refs(handle), 3)
        del other
        gc.collect()
        self.assertEqual(self.refs(handle), 0)
        # Releases are notifications: nothing waits for their answer.
        releases = [m for m in self.received() if m["method"] == "release"]
        self.assertEqual(len(releases), 3)
        self.assertTrue(all("id" not in m for m in releases))

    def test_release_gives_back_every_reference_now(self):
        other = self.widget.Other()
        other.Same()
        handle = other.handle
        self.mox.release(other)
        self.assertEqual(self.refs(handle), 0)
        del other
        gc.collect()
        # The proxy released by hand sends nothing more when it is collected.
        self.assertEqual(self.refs(handle), 0)


class EventTest(FakeServerCase):
    def fire(self, value):
        """Raises Changed with ``value``; the host's answer as the server received it."""
        return json.loads(self.widget.Fire(value))

    def test_unhandled_events_are_not_raised(self):
        self.assertEqual(self.widget.Fire(1), "not connected")
        self.mox.on(self.widget, "Changed", lambda event: None)
        connect = [m for m in self.received() if m["method"] == "connect"]
        self.assertEqual(connect[-1]["params"], {"object": self.widget.handle,
                                                 "events": ["changed"]})
        self.mox.disconnect(self.widget)
        self.assertEqual(self.widget.Fire(1), "not connected")

    def test_handler_results_go_back_as_the_final_arguments(self):
        when = datetime.datetime(2026, 12, 6, 14, 30)
        cases = [
            ("assigned to event.args", lambda event: event.args.__setitem__(0, when),
             {"$date": "2026-12-06T14:30:00"}),
            ("returned as a list", lambda event: [decimal.Decimal("2.5"), event.args[1]],
             {"$currency": "2.5"}),
            ("left alone", lambda event: None, 7),
        ]
        for name, handler, expected in cases:
            with self.subTest(name):
                self.mox.on(self.widget, "Changed", handler)
                answer = self.fire(7)
                self.assertEqual(answer["result"]["args"],
                                 [expected, {"$object": self.widget.handle}])

    def test_handler_sees_decoded_arguments_and_its_source(self):
        seen = []
        self.mox.on(self.widget, "Changed", seen.append)
        self.fire(decimal.Decimal("12.3400"))
        event = seen[0]
        self.assertEqual((event.name, event.dispid), ("Changed", 1))
        self.assertIs(event.source, self.widget)
        self.assertEqual(event.args[0], decimal.Decimal("12.3400"))
        # An object in an event is the proxy the host already holds.
        self.assertIs(event.args[1], self.widget)

    def test_handler_may_call_back_into_the_component(self):
        def handler(event):
            event.args[0] = event.source.Name
            event.source.Name = "renamed"
        self.mox.on(self.widget, "Changed", handler)
        answer = self.fire(0)
        self.assertEqual(answer["result"]["args"][0], "Grüße\u2028zwei")

    def test_failing_handler_answers_an_error_and_the_client_goes_on(self):
        def handler(event):
            raise ValueError("no value for you")
        self.mox.on(self.widget, "Changed", handler)
        answer = self.fire(0)
        self.assertNotIn("result", answer)
        self.assertEqual(answer["error"]["code"], COMPONENT_ERROR)
        self.assertIn("no value for you", answer["error"]["message"])
        self.assertEqual(self.widget.Typed(1), EMPTY)

    def test_request_other_than_an_event_is_answered_method_not_found(self):
        answer = json.loads(self.widget.Ask())
        self.assertEqual(answer["error"]["code"], METHOD_NOT_FOUND)
        self.assertEqual(answer["id"], "s1")


if __name__ == "__main__":
    unittest.main()
