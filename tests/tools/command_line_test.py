"""The command line as a user meets it: what it refuses and how, help, lists, exit codes."""

import os
import signal
import unittest

import tool
from tool import DEVICE, INPUT, INTERRUPTED, OUTPUT, USAGE


class CommandLine(tool.TestCase):
    def test_tells_of_itself_and_of_the_devices(self):
        for arguments, part in (("--help", b"Exit codes:"),
                                ("decode -h", b"  130  interrupted"),
                                ("manual", b".SH EXIT STATUS"),
                                ("completion bash", b"--per-picture"),
                                ("devices", b"* msm8960 "),
                                ("components", b"hardware version 1"),
                                ("components -d exynos4", b"no components")):
            ended = tool.run(*arguments.split())
            self.assertEqual((ended.code, ended.err), (0, ""), arguments)
            self.assertIn(part, ended.out)
        for device in self.report("devices", "-d", "omap4")["devices"]:
            is_omap4 = device["decoder"] == "OMX.TI.DUCATI1.VIDEO.DECODER=="
            self.assertEqual((device["chosen"], device["name"] == "omap4"), (is_omap4, is_omap4))
        self.assertEqual(self.report("components", "-d", "omap4")["device"], "omap4")
        silent = {"OMXBRIDGE_MEDIASERVER": "/missing", "OMXBRIDGE_LOG": "silent"}
        self.assertEnds(tool.run("components", environment=silent), DEVICE, "OMXBRIDGE_MEDIASERVER")

    def test_names_what_it_does_not_understand_or_finds_wrong(self):
        text = self.write("notes.txt", b"nothing of interest, but rather long")
        empty = self.write("empty", b"")
        small, large = self.directory / "small.y4m", self.directory / "large.y4m"
        self.report("convert", "-s", "64x48", "-n", 1, "-o", small)
        self.report("convert", "-s", "96x64", "-n", 3, "-o", large)
        for arguments, code, complaint in (
                ([], USAGE, "subcommand is required"),
                (["call", "--loud"], USAGE, "--loud"),
                (["call", "--size", "640"], USAGE, '"640" is not a size as 640x480'),
                (["call", "--bitrate", "1G"], USAGE, '"1G" is not a rate from 1k to 1000M'),
                (["call", "--frames", "99999999999999999999"], USAGE, "is not a number from 1 on"),
                (["call", "--device", "abacus"], USAGE, 'no device "abacus"; there are msm7x30, '),
                (["call", "-o", "-", "--stream", "-"], USAGE, "cannot both go to -"),
                (["call", "-o", "-", "--json"], USAGE, "--json needs standard output for itself"),
                (["call", "--at", "soon", "keyframe"], USAGE, '"soon" is not a time as 3s'),
                (["call", "--at", "3s", "rotate=45"], USAGE, '"rotate=45" is not a change as bitrate=300k'),
                (["call", "--loss", "101%"], USAGE, "is not a share of packets"),
                (["call", text], INPUT, "notes.txt"),
                (["call", empty], INPUT, "empty"),
                (["call", self.directory], INPUT, str(self.directory)),
                (["call", "-o", "/dev/full"], OUTPUT, "/dev/full"),
                (["call", "--at", "1s", "fps=60"], USAGE, "fps=60 is more than the input has"),
                (["call", "-d", "exynos4"], DEVICE, "exynos4"),
                (["call", "-s", "8192x16", "-n", 1], DEVICE, "8192x16"),
                (["convert", small, "--cut", "96x96"], USAGE, "is larger than the picture, which is 64x48"),
                (["convert", small, "--scale", "33x32"], USAGE, '"33x32" is not an even size'),
                (["compare", small, large], INPUT, "the pictures differ in size, 64x48 and 96x64"),
                (["encode", large, "-o", "/dev/full", "--format", "mp4"], OUTPUT, "no space left")):
            with self.subTest(complaint):
                ended = tool.run(*arguments)
                self.assertEnds(ended, code, complaint)
                # What only the input shows is found when the device has been told.
                if code == USAGE:
                    self.assertRegex(ended.out, rb"^(Device |\Z)")
        ended = tool.run("devices", environment={"OMXBRIDGE_DEVICE": "abacus"})
        self.assertEnds(ended, USAGE, 'OMXBRIDGE_DEVICE: no device "abacus"')
        self.assertEqual(len(self.names()), 4, "left behind")
        with open("/dev/full", "wb") as full:
            self.assertEnds(tool.run("devices", stdout=full), OUTPUT)

    def test_ends_at_ctrl_c_while_it_waits_for_input(self):
        path = self.directory / "pipe"
        os.mkfifo(path)
        with open(path, "r+b", buffering=0) as pipe:  # for both, which does not wait for the tool
            for number in (signal.SIGINT, signal.SIGTERM):
                with tool.Process("call", "-", "-o", self.directory / "a.y4m", stdin=path) as process:
                    pipe.write(b"YUV4MPEG2 W64 H64 F30:1\n")
                    process.wait_for_output(b"Components")
                    process.signal(number)
                    self.assertEnds(process.finish(), INTERRUPTED)
                self.assertEqual(self.names(), ["pipe"])


if __name__ == "__main__":
    unittest.main()
