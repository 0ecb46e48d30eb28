"""Counters of this device, which vesprun reports once a day as far as its whitelist allows.

    import vesprun

    with vesprun.Counters() as counters:
        counters.add("app.requests")
        with counters.time("app.milliseconds"):
            answer()

Changes are collected and go to the socket of `vespctl listen` when they fill a datagram, every ten
seconds, and at the end. Any thread may change counters. A program never fails because nobody
listens: changes then wait, and only `flush` says so.
"""

from __future__ import annotations

import atexit
import contextlib
import math
import os
import re
import socket
import threading
import time as _time
import weakref
from collections.abc import Iterator

__all__ = ["DEFAULT_SOCKET", "Counters"]

DEFAULT_SOCKET = "/run/vesprun/counters"

_MAX_DATAGRAM = 8192
_MAX_KEY = 1024
_MAX_WAITING = 256  # datagrams, while nobody listens
_NOT_IN_KEYS = re.compile("[\x00-\x1f:|\ufffe\uffff]")
_MIN_INTEGER = -(2**63)
_MAX_INTEGER = 2**63 - 1


def _checked_key(key: str) -> str:
    if not isinstance(key, str):
        raise TypeError(f"a key is a str, not {type(key).__name__}")
    if not key or len(key.encode()) > _MAX_KEY:
        raise ValueError(f"a key has 1 to {_MAX_KEY} bytes")
    if found := _NOT_IN_KEYS.search(key):
        raise ValueError(f"a key cannot hold {found[0]!r}")
    return key


def _checked_integer(value: int) -> int:
    if not isinstance(value, int) or isinstance(value, bool):
        raise TypeError(f"a scalar is an int, not {type(value).__name__}")
    if not _MIN_INTEGER <= value <= _MAX_INTEGER:
        raise OverflowError(f"{value} does not fit 64 bits")
    return value


class Counters:
    """Sends changes of counters to the socket at `path`.

    `interval` is the time in seconds after which changes are sent at the latest; with `None` they
    wait for `flush`. While nobody listens, 2 MiB of changes wait, the newest; `lost` counts the
    datagrams that were given up.

    Which keys count is the listener's business: a user's programs have the beginnings that the
    device's description grants, "app." unless it says otherwise.
    """

    lost: int

    def __init__(
        self, path: str | os.PathLike[str] = DEFAULT_SOCKET, interval: float | None = 10.0
    ) -> None:
        self.lost = 0
        self._path = os.fspath(path)
        self._lines = bytearray()
        self._waiting: list[bytes] = []
        self._lock = threading.RLock()
        self._socket: socket.socket | None = None
        self._ends = threading.Event()
        self._interval = interval
        self._thread: threading.Thread | None = None
        _all_counters.add(self)

    def add(self, key: str, value: int = 1) -> None:
        """Adds to a scalar of today; a missing one counts as 0."""
        self._append(f"{_checked_key(key)}:{_checked_integer(value)}|c\n")

    def set(self, key: str, value: int) -> None:
        """Sets a scalar of today."""
        self._append(f"{_checked_key(key)}:{_checked_integer(value)}|g\n")

    def append(self, key: str, value: float) -> None:
        """Adds one more value to a distribution of today."""
        if not isinstance(value, (int, float)) or isinstance(value, bool):
            raise TypeError(f"a value is a number, not {type(value).__name__}")
        number = float(value)
        if not math.isfinite(number):
            raise ValueError(f"{value} is not finite")
        self._append(f"{_checked_key(key)}:{number!r}|d\n")

    @contextlib.contextmanager
    def time(self, key: str) -> Iterator[None]:
        """Adds the milliseconds that the block took to a distribution, also when it raises."""
        _checked_key(key)
        begin = _time.perf_counter()
        try:
            yield
        finally:
            self.append(key, (_time.perf_counter() - begin) * 1000)

    def flush(self) -> None:
        """Sends all changes. Raises OSError when nobody takes them; they wait for the next time."""
        with self._lock:
            self._end_datagram()
            while self._waiting:
                self._send(self._waiting[0])
                self._waiting.pop(0)

    def close(self) -> None:
        """Sends all changes, and ends the periodic sending until a later change begins it again."""
        self._ends.set()
        thread, self._thread = self._thread, None
        if thread is not None and thread is not threading.current_thread():
            thread.join()
        with self._lock:
            with contextlib.suppress(OSError):
                self.flush()
            self.lost += len(self._waiting)
            self._waiting.clear()
            self._disconnect()

    def __enter__(self) -> Counters:
        return self

    def __exit__(self, *_: object) -> None:
        self.close()

    def _append(self, line: str) -> None:
        encoded = line.encode()
        with self._lock:
            if len(self._lines) + len(encoded) > _MAX_DATAGRAM:
                self._end_datagram()
                with contextlib.suppress(OSError):  # they wait
                    self.flush()
            self._lines += encoded
            if self._thread is None and self._interval is not None:
                self._ends = threading.Event()
                self._thread = threading.Thread(
                    target=self._send_periodically, args=(self._ends, self._interval), daemon=True
                )
                self._thread.start()

    def _end_datagram(self) -> None:
        if self._lines:
            self._waiting.append(bytes(self._lines))
            self._lines.clear()
            if len(self._waiting) > _MAX_WAITING:
                self._waiting.pop(0)
                self.lost += 1

    def _send(self, datagram: bytes) -> None:
        for attempt in (1, 2):  # a listener that was started anew has another socket
            try:
                if self._socket is None:
                    self._socket = socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM)
                    self._socket.settimeout(1.0)
                    self._socket.connect(self._path)
                self._socket.send(datagram)
                return
            except OSError:
                self._disconnect()
                if attempt == 2:
                    raise

    def _disconnect(self) -> None:
        if self._socket is not None:
            self._socket.close()
            self._socket = None

    def _send_periodically(self, ends: threading.Event, interval: float) -> None:
        while not ends.wait(interval):
            with contextlib.suppress(OSError):  # they wait for the next time
                self.flush()

    def _forget(self) -> None:
        """In a new process: what was collected is its parent's to send."""
        self._lock = threading.RLock()
        self._lines.clear()
        self._waiting.clear()
        self._socket = None
        self._thread = None


_all_counters: weakref.WeakSet[Counters] = weakref.WeakSet()


def _at_end() -> None:
    for counters in list(_all_counters):
        counters.close()


def _after_fork() -> None:
    for counters in list(_all_counters):
        counters._forget()


atexit.register(_at_end)
os.register_at_fork(after_in_child=_after_fork)
