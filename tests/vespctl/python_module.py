#!/usr/bin/env python3
"""The Python module (argument 1: its folder) against a socket of this test."""
import os
import pathlib
import socket
import sys
import tempfile
import threading
import unittest

sys.path.insert(0, sys.argv.pop(1))
import vesprun  # noqa: E402


class CountersTest(unittest.TestCase):
    def setUp(self):
        self.folder = tempfile.TemporaryDirectory()
        self.addCleanup(self.folder.cleanup)
        self.path = pathlib.Path(self.folder.name) / "socket"
        self.socket = self.listen()

    def listen(self):
        listener = socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM)
        listener.bind(str(self.path))
        listener.settimeout(10)
        self.addCleanup(listener.close)
        return listener

    def received(self):
        return self.socket.recv(65536).decode()

    def test_lines(self):
        with vesprun.Counters(self.path) as counters:
            counters.add("a")
            counters.set("b", -(2**63))
            counters.append("c", 0.1)
            with self.assertRaises(KeyError), counters.time("d"):
                raise KeyError
        self.assertRegex(self.received(), r"\Aa:1\|c\nb:-9223372036854775808\|g\nc:0\.1\|d\nd:[0-9.e-]+\|d\n\Z")

    def test_refusals_change_nothing(self):
        with vesprun.Counters(self.path) as counters:
            for key in ("", "a:b", "a|b", "a\nb", "x" * 1025, "\x01"):
                self.assertRaises(ValueError, counters.add, key)
            for value, error in ((2**63, OverflowError), (1.5, TypeError), (True, TypeError)):
                self.assertRaises(error, counters.set, "a", value)
            self.assertRaises(ValueError, counters.append, "a", float("nan"))
            self.assertRaises(TypeError, counters.add, b"a")
            counters.add("end")
        self.assertEqual(self.received(), "end:1|c\n")

    def test_whole_lines_fill_datagrams(self):
        with vesprun.Counters(self.path, interval=None) as counters:
            reader = threading.Thread(target=lambda: datagrams.extend(self.received() for _ in range(3)))
            datagrams = []
            reader.start()
            for i in range(1000):
                counters.add(f"some.longer.key.{i}")
            counters.flush()
            reader.join()
        self.assertEqual("".join(datagrams), "".join(f"some.longer.key.{i}:1|c\n" for i in range(1000)))
        self.assertTrue(all(len(d) <= 8192 for d in datagrams))

    def test_periodic_flush_and_a_new_listener(self):
        with vesprun.Counters(self.path, interval=0.01) as counters:
            counters.add("a")
            self.assertEqual(self.received(), "a:1|c\n")
            self.socket.close()
            os.remove(self.path)
            counters.add("b")
            self.assertRaises(OSError, counters.flush)
            self.socket = self.listen()
            self.assertEqual(self.received(), "b:1|c\n")

    def test_a_child_does_not_send_again(self):
        with vesprun.Counters(self.path, interval=None) as counters:
            counters.add("a")
            child = os.fork()
            if child == 0:
                counters.add("child")
                counters.flush()
                os._exit(0)
            os.waitpid(child, 0)
            self.assertEqual(self.received(), "child:1|c\n")
        self.assertEqual(self.received(), "a:1|c\n")


if __name__ == "__main__":
    unittest.main()
