"""Calls and decodings on every emulated device, with the real components: what comes out, and what the report
says of it."""

import json
import os
import signal
import unittest

import tool


def pictures_in(path, size):
    """How many pictures a Y4M file of that size (columns, rows) holds; -1 where it is not whole."""
    content = path.read_bytes()
    each = len(b"FRAME\n") + size[0] * size[1] * 3 // 2
    count, rest = divmod(len(content) - content.find(b"\n") - 1, each)
    return count if content.startswith(b"YUV4MPEG2 ") and rest == 0 else -1


class CallOn(tool.TestCase):
    """On the device that CALL_DEVICE names."""

    def setUp(self):
        super().setUp()
        self.device = os.environ["CALL_DEVICE"]
        self.least_psnr = 28 if self.device == "msm8x60" else 35  # dB; that one delivers RGB565

    def test_loses_nothing_and_keeps_its_quality_and_rate(self):
        frames = int(os.environ["CALL_FRAMES"])
        figures = self.report("call", "-d", self.device, "-n", frames)
        self.assertFields(figures, device=self.device, frames_in=frames, frames_encoded=frames,
                          frames_decoded=frames, frames_dropped=0, frames_out_of_order=0,
                          bitrate_target=1_000_000)
        self.assertAlmostEqual(figures["bitrate_reached"], 1e6, delta=1e5)
        self.assertGreaterEqual(figures["psnr_y"], self.least_psnr)
        self.assertLess(figures["psnr_y"], 60, "no lossy coder does that")
        self.assertGreater(figures["latency_ms"]["p50"], 0)
        self.assertGreater(figures["cpu_seconds"], 0)

    def test_writes_a_stream_that_decodes_to_the_pictures_it_wrote(self):
        stream, called, decoded = (self.directory / name for name in ("a.264", "called.y4m", "decoded.y4m"))
        figures = self.report("call", "-d", self.device, "-s", "320x176", "--fps", 25, "-n", 40, "-k", 10,
                              "-p", "high", "--stream", stream, "-o", called)
        self.assertEqual(figures["profile"], 66 if self.device == "msm7x30" else 100)
        self.assertEqual(pictures_in(called, (320, 176)), 40)
        again = self.report("decode", "-d", self.device, stream, "-o", decoded, "--fps", 25)
        self.assertEqual(again["access_units"], 40)
        self.assertTrue(called.read_bytes() == decoded.read_bytes())
        self.assertEqual(len(self.names()), 3)

    def test_carries_out_changes_at_the_picture_they_are_meant_for(self):
        # Pictures 0 to 59 as configured, a key frame at 30 and from there on three times the bits; then half
        # as many pictures; then turned on their side.
        pictures = self.directory / "a.y4m"
        figures = self.report("call", "-d", self.device, "-s", "200x120", "-n", 120, "-b", "200k",
                              "--at", "2s", "fps=15", "--at", "1s", "keyframe", "--at", "3000ms", "rotate=90",
                              "-o", pictures, "--at", "1s", "bitrate=600k")
        self.assertFields(figures, frames_in=90, frames_dropped=0, key_frames=[0, 30, 75])
        self.assertEqual(figures["changes"][0], {"seconds": 1.0, "change": "keyframe"})
        self.assertAlmostEqual(figures["bitrate_reached"], 500_000, delta=100_000)
        self.assertGreaterEqual(figures["psnr_y"], self.least_psnr, "pictures turned in the same way")
        self.assertEqual(pictures_in(pictures, (200, 120)), 90)


class Call(tool.TestCase):
    def test_recovers_from_losses_the_same_way_every_time_and_reports_them(self):
        page, snapshot = self.directory / "call.html", self.directory / "first.png"
        arguments = "call -s 192x128 -b 600k -k 0 --loss 1% --delay 40ms -n 200 --seed 3 --reorder 2%".split()
        first = self.report(*arguments)
        again = self.report(*arguments, "--report", page, "--snapshot", "1s", snapshot)
        self.assertGreater(first["network"]["packets_lost"], 0)
        self.assertGreater(first["network"]["packets_late"], 0)
        self.assertEqual(first["network"]["pictures_lost"], first["frames_dropped"])
        self.assertGreater(first["frames_decoded"], 100)
        self.assertEqual(first["frames_out_of_order"], 0)
        self.assertGreater(first["psnr_y"], 30, "broken pictures have been shown")
        self.assertGreaterEqual(first["latency_ms"]["p50"], 40)
        self.assertGreaterEqual(len(first["key_frames"]), 2, "one for the beginning, others on request")
        for key in ("network", "key_frames", "psnr_y", "bitrate_reached"):
            self.assertEqual(first[key], again[key])
        html = page.read_text()
        self.assertIn("packets lost", html)
        self.assertIn("data:image/png;base64,iVBORw0KGgo", html)
        self.assertNotIn("http://", html, "nothing comes from elsewhere")
        self.assertTrue(html.endswith("</html>\n"))
        self.assertTrue(snapshot.read_bytes().startswith(b"\x89PNG"))

    def test_ends_cleanly_at_ctrl_c(self):
        output = self.directory / "a.y4m"
        # The stream on standard output shows that the call runs.
        with tool.Process("call", "-n", 1_000_000_000, "-r", "--stream", "-", "-o", output) as process:
            process.wait_for_output(b"\0\0\1")
            self.assertFalse(output.exists())
            process.signal(signal.SIGINT)
            self.assertEnds(process.finish(), tool.INTERRUPTED, "Dropped        0")
        self.assertGreaterEqual(pictures_in(output, (640, 480)), 1)
        self.assertEqual(self.names(), ["a.y4m"])

    def test_ends_when_nobody_reads_its_output(self):
        stream = self.directory / "a.264"
        with tool.Process("call", "-n", 1_000_000_000, "-o", "-", "--stream", stream) as process:
            process.wait_for_output(b"FRAME")
            process.close_output()
            self.assertEnds(process.finish(), tool.OUTPUT, "standard output: whoever was reading it has gone")
        self.assertEqual(self.names(), [])


class Decode(tool.TestCase):
    def test_takes_damage_and_reports_pictures_that_change_their_size(self):
        streams = []
        for size in ("64x48", "96x64"):
            path = self.directory / size
            self.report("call", "-s", size, "-n", 20, "--stream", path)
            streams.append(path.read_bytes())
        small, large = streams
        both = self.write("both.264", small + large)
        raw, y4m = self.directory / "both.yuv", self.directory / "both.y4m"
        self.assertFields(self.report("decode", both, "-o", raw), frames_decoded=40, size_changes=1)
        self.assertEqual(raw.stat().st_size, 20 * (64 * 48 + 96 * 64) * 3 // 2)
        self.assertEnds(tool.run("decode", both, "-o", y4m), tool.OUTPUT, "--format raw")
        self.assertFalse(y4m.exists())

        damaged = bytearray(large)
        for at in range(len(damaged) // 4, len(damaged), 97):
            damaged[at] = at % 256
        ended = tool.run("decode", self.write("damaged.264", damaged + small), "--json")
        self.assertIn(ended.code, (0, tool.INPUT), ended.err)
        decoded = json.loads(ended.out)["frames_decoded"]
        self.assertGreaterEqual(decoded, 20, "what comes behind the damage is not lost")


if __name__ == "__main__":
    unittest.main()
