#!/usr/bin/env python3
"""What `./dev aar` says to bad input, and how it goes on after an interrupted run.

The scripts run in a copy of the project's folder. Instead of an NDK, CMake and Debian's archive they
find stand-ins that make small files, wait or fail as the test says.
"""

import os
import shutil
import signal
import subprocess
import tempfile
import unittest
from pathlib import Path

PROJECT = Path(__file__).resolve().parent.parent.parent
SCRIPTS = ("aar", "android-ndk", "android-dependencies", "android-sources")
ABIS = "arm64-v8a, armeabi-v7a and x86_64"

# "source NAME=VERSION": half a source, then the order in the file `order`, then the other half.
# Ordered to wait, it sleeps until the test, which it has told its number, kills it.
APT = """#!/bin/sh
echo "$4" >>../../../apt.log
mkdir tree-$$ && echo half >tree-$$/first
case $(cat ../../../order) in
wait) echo $$ >../../../waiting; exec sleep 600 ;;
fail) exit 1 ;;
esac
echo whole >tree-$$/second
"""

# Makes what the recipes copy. Ordered to wait, it sleeps until the test kills it.
CMAKE = """#!/bin/sh
echo "$*" >>"$STAND_IN/cmake.log"
case $1 in
--build)
    case $(cat "$STAND_IN/order") in
    wait) echo $$ >"$STAND_IN/waiting"; exec sleep 600 ;;
    fail) echo "no compiler"; exit 1 ;;
    esac
    mkdir -p "$2/lib" && : >"$2/lib/libcurl.a" ;;
--install) mkdir -p "$2/../prefix/lib" "$2/../prefix/include" ;;
esac
"""


def write_program(path, text):
    path.parent.mkdir(parents=True, exist_ok=True)
    path.write_text(text)
    path.chmod(0o755)


class AarTest(unittest.TestCase):
    def setUp(self):
        scratch = tempfile.TemporaryDirectory()
        self.addCleanup(scratch.cleanup)
        self.root = Path(scratch.name)
        (self.root / "scripts").mkdir()
        for name in SCRIPTS:
            shutil.copy(PROJECT / "scripts" / name, self.root / "scripts")
        shutil.copy(PROJECT / "CMakeLists.txt", self.root)
        self.recipe = self.root / "platforms/android/dependencies"
        self.recipe.mkdir(parents=True)
        (self.recipe / "sources.txt").write_text("# a comment\ndebian curl 1.0\n")
        write_program(self.root / "scripts/debian-apt", APT)
        write_program(self.root / "bin/cmake", CMAKE)
        self.ndk = self.root / "ndk"
        write_program(self.ndk / "build/cmake/android.toolchain.cmake", "")
        write_program(self.ndk / "toolchains/llvm/prebuilt/host/bin/llvm-strip", "")
        self.order("go")

    def order(self, what):
        (self.root / "order").write_text(what + "\n")

    def start(self, *command, ndk=None):
        environment = dict(os.environ, STAND_IN=str(self.root),
                           PATH=f"{self.root}/bin:{os.environ['PATH']}",
                           ANDROID_NDK_HOME=str(self.ndk) if ndk is None else ndk)
        return subprocess.Popen(command, cwd=self.root, env=environment, text=True,
                                stdout=subprocess.PIPE, stderr=subprocess.PIPE,
                                start_new_session=True)

    def run_script(self, *command, ndk=None):
        process = self.start(*command, ndk=ndk)
        out, err = process.communicate()
        return process.returncode, out, err

    def kill_while_waiting(self, *command):
        """Kills the command and all that it started when a stand-in has begun to wait."""
        os.mkfifo(self.root / "waiting")
        self.order("wait")
        process = self.start(*command)
        (self.root / "waiting").read_text()
        os.killpg(process.pid, signal.SIGKILL)
        process.communicate()
        self.order("go")

    def lines(self, name):
        path = self.root / name
        return path.read_text().splitlines() if path.exists() else []

    def expect_refusal(self, status, message, *arguments, ndk=None):
        self.assertEqual((status, "", message),
                         self.run_script("scripts/aar", *arguments, ndk=ndk))

    def test_what_is_no_ndk(self):
        self.expect_refusal(
            2, "aar: ANDROID_NDK_HOME is not set; it has to be the folder of the Android NDK, r26 "
               "or later (an archive without libraries: ./dev aar --without-native)\n", ndk="")
        self.expect_refusal(2, "aar: ANDROID_NDK_HOME has to be an absolute path, not ndk\n",
                            ndk="ndk")
        self.expect_refusal(2, "aar: ANDROID_NDK_HOME is no Android NDK: there is no "
                               "/proc/build/cmake/android.toolchain.cmake\n", ndk="/proc")
        shutil.rmtree(self.ndk / "toolchains")
        self.expect_refusal(2, "aar: ANDROID_NDK_HOME is no whole Android NDK: there is no "
                               f"llvm-strip in {self.ndk}/toolchains/llvm/prebuilt\n")
        self.assertFalse((self.root / "build").exists())

    def test_words_that_it_does_not_know(self):
        usage = "usage: ./dev aar [ABI...] or ./dev aar --without-native\n"
        self.expect_refusal(2, f"aar: unknown ABI: mips; there are {ABIS}\n", "x86_64", "mips")
        self.expect_refusal(2, "aar: unknown option: --fast\n" + usage, "--fast")
        self.expect_refusal(2, "aar: --without-native takes no ABI\n" + usage, "--without-native",
                            "x86_64")
        self.assertFalse((self.root / "build").exists())

    def test_folders_that_cannot_be_written(self):
        (self.root / "build").write_text("a file")
        self.expect_refusal(1, "aar: the folder build cannot be written\n", "x86_64")
        self.expect_refusal(1, "aar: the folder build cannot be written\n", "--without-native")
        (self.root / "build").unlink()
        (self.root / "build").mkdir()
        (self.root / "build/java").write_text("a file")
        self.expect_refusal(1, "aar: the folder build/java cannot be written\n", "x86_64")
        (self.root / "build/java").unlink()
        (self.root / "build/android-x86_64").write_text("a file")
        self.expect_refusal(
            1, f"aar: {self.root}/build/android-x86_64 cannot be written\n", "x86_64")
        (self.root / "build/android-sources").write_text("a file")
        (self.root / "build/android-x86_64").unlink()
        self.expect_refusal(1, "aar: build/android-sources cannot be written\n", "x86_64")

    def fetched(self):
        folder = self.root / "build/android-sources/curl"
        return sorted(path.name for path in folder.iterdir()) if folder.exists() else []

    def test_a_source_is_fetched_once(self):
        for _ in range(2):
            self.assertEqual(0, self.run_script("scripts/android-sources")[0])
        self.assertEqual(["curl=1.0"], self.lines("apt.log"))
        self.assertEqual(["first", "second"], self.fetched())

    def test_a_half_unpacked_source_is_fetched_again(self):
        self.kill_while_waiting("scripts/android-sources")
        self.assertEqual([], self.fetched())
        self.assertEqual(0, self.run_script("scripts/android-sources")[0])
        self.assertEqual(["first", "second"], self.fetched())
        self.assertEqual(["curl=1.0"] * 2, self.lines("apt.log"))

    def test_a_source_that_cannot_be_fetched(self):
        self.order("fail")
        self.assertEqual((1, "aar: fetching curl 1.0\n", "aar: fetching curl 1.0 failed, see "
                             "build/android-sources/fetch.log\n"),
                         self.run_script("scripts/android-sources"))
        self.order("go")
        self.assertEqual(0, self.run_script("scripts/android-sources")[0])
        self.assertEqual(["first", "second"], self.fetched())

    def build(self):
        return self.run_script("scripts/android-dependencies", "x86_64")

    def prefix(self):
        return self.root / "build/android-x86_64/prefix"

    def fetch(self):
        self.assertEqual(0, self.run_script("scripts/android-sources")[0])
        (self.root / "build/android-sources/curl/include/curl").mkdir(parents=True)

    def test_dependencies_are_built_once(self):
        self.fetch()
        self.assertEqual(0, self.build()[0])
        commands = self.lines("cmake.log")
        self.assertEqual((0, "", ""), self.build())
        self.assertEqual(commands, self.lines("cmake.log"))
        (self.prefix() / "lib/libold.a").touch()
        (self.recipe / "sources.txt").write_text("debian curl 1.0\n")
        for _ in range(2):
            self.assertEqual(0, self.build()[0])
        self.assertEqual(commands * 2, self.lines("cmake.log"))
        self.assertFalse((self.prefix() / "lib/libold.a").exists())

    def test_an_interrupted_build_starts_again(self):
        self.fetch()
        self.kill_while_waiting("scripts/android-dependencies", "x86_64")
        self.assertFalse(self.prefix().exists())
        self.assertEqual(0, self.build()[0])
        self.assertTrue((self.prefix() / "lib/libcurl.a").exists())

    def test_a_build_that_fails_names_its_log(self):
        self.fetch()
        self.order("fail")
        log = "build/android-x86_64/dependencies/libraries.log"
        self.assertEqual((1, "aar: x86_64: libraries\n",
                          f"aar: x86_64: libraries failed, see {log}\n"), self.build())
        self.assertIn("no compiler", self.lines(log))
        self.order("go")
        self.assertEqual(0, self.build()[0])


if __name__ == "__main__":
    unittest.main()
