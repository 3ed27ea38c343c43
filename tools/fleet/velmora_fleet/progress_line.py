"""Sessions done out of the total and the rate, rewritten in place on a terminal; nothing at
all when the stream is a pipe or a file."""
import time


class ProgressLine:
    def __init__(self, total, stream):
        self.total = total
        self.done = 0
        self.stream = stream
        self.shown = stream.isatty()
        self.start = time.monotonic()

    def step(self):
        self.done += 1
        if not self.shown:
            return
        elapsed = max(time.monotonic() - self.start, 1e-6)
        self.stream.write("\rvelmora-fleet: %d/%d sessions, %.1f/s " % (
            self.done, self.total, self.done / elapsed))
        self.stream.flush()

    def finish(self):
        if self.shown and self.done:
            self.stream.write("\n")
            self.stream.flush()
