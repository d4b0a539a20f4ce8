#!/usr/bin/env python3
"""Shows that scripts/check-javadoc finds what a comment leaves out, and accepts the project's."""

import subprocess
import tempfile
import unittest
from pathlib import Path

PROJECT = Path(__file__).resolve().parent.parent.parent
GOOD = """package example;

/** A part. Any thread may call any method. */
public final class Part {
    /** Receives events, on the executor of the part. */
    public interface Listener {}

    /**
     * Opens the part.
     *
     * @throws IllegalStateException if it is open
     */
    public void open(int mode) {
        if (mode > 0) {
            throw new IllegalStateException("open");
        }
    }

    private void check() {
        throw new IllegalArgumentException();
    }
}
"""


class CheckJavadocTest(unittest.TestCase):
    def check(self, *files):
        return subprocess.run([PROJECT / "scripts/check-javadoc", *files], capture_output=True,
                              text=True, check=False)

    def expect(self, text, *faults):
        with tempfile.TemporaryDirectory() as folder:
            file = Path(folder) / "Part.java"
            file.write_text(text)
            result = self.check(file)
        self.assertEqual([f"check-javadoc: Part.java: {fault}" for fault in faults],
                         result.stderr.splitlines())
        self.assertEqual(1 if faults else 0, result.returncode)

    def spoil(self, old, new):
        self.assertIn(old, GOOD)
        return GOOD.replace(old, new)

    def test_the_project(self):
        result = self.check()
        self.assertEqual(("", 0), (result.stderr, result.returncode))

    def test_a_good_comment(self):
        self.expect(GOOD)

    def test_a_class_without_a_word_on_threads(self):
        self.expect(self.spoil(" Any thread may call any method.", ""),
                    "Part does not say which threads may use it")

    def test_an_interface_without_a_word_on_threads(self):
        self.expect(self.spoil(", on the executor of the part", ""),
                    "Listener does not say which threads may use it")

    def test_an_exception_that_is_not_named(self):
        self.expect(self.spoil("@throws IllegalStateException", "@throws RuntimeException"),
                    "open throws IllegalStateException without saying so")

    def test_a_public_method_without_a_comment(self):
        self.expect(self.spoil("private void check", "public void check"),
                    "check throws IllegalArgumentException without saying so")


if __name__ == "__main__":
    unittest.main()
