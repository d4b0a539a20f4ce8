#!/usr/bin/env python3
"""Shows that each check of scripts/check-android fails on an archive that is spoilt for it alone.

The archive is a small one: one library, made with this machine's compiler against stub libraries,
and one class. The stubs stand in a folder of the form of an NDK. What the check compares with is in
a copy of the project's script beside lists of the test's own.
"""

import os
import re
import shutil
import subprocess
import tempfile
import unittest
import zipfile
from pathlib import Path

PROJECT = Path(__file__).resolve().parent.parent.parent

SOURCE = """
extern int puts(const char*);
extern void *__memcpy_chk(void*, const void*, unsigned long, unsigned long);
extern void __stack_chk_fail(void);
void Java_korvel_Kit_call(void) { puts("called"); }
int JNI_OnLoad(void) { char a[8]; __memcpy_chk(a, "", 1, 8); return a[0]; }
void (*keep)(void) = __stack_chk_fail;
"""
SMALL = SOURCE.replace("__memcpy_chk(a, \"\", 1, 8)", "puts(a)")
WITHOUT_PROTECTOR = SOURCE.replace("void (*keep)(void) = __stack_chk_fail;", "")
MORE = SOURCE + "void inflate(void) {}\n"
NEWER = SOURCE + "extern void newer(void); void (*keep2)(void) = newer;\n"
LINK = ["-Wl,-z,max-page-size=16384", "-Wl,-z,relro,-z,now,-z,noexecstack",
        "-Wl,--build-id=sha1", "-Wl,-soname,libKorvelTalvox.so"]
EXPORTS = "-Wl,--version-script="
MANIFEST = """<manifest xmlns:android="http://schemas.android.com/apk/res/android"
    package="korvel.talvox">
    <uses-sdk android:minSdkVersion="24" />
    <uses-permission android:name="android.permission.INTERNET" />
</manifest>
"""
RULES = "-keep class korvel.Kit { *; }\n"
KIT = "package korvel; public class Kit { native void call(); }"


def run(*command, **options):
    return subprocess.run([str(c) for c in command], check=True, capture_output=True, text=True,
                          **options)


class CheckAndroidTest(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.scratch = tempfile.TemporaryDirectory()
        cls.root = Path(cls.scratch.name)
        cls.script = cls.root / "project/scripts/check-android"
        package = cls.root / "project/platforms/android/package"
        rules = cls.root / "project/platforms/android/java/consumer-rules.pro"
        for folder in (cls.script.parent, package, rules.parent):
            folder.mkdir(parents=True)
        shutil.copy(PROJECT / "scripts/check-android", cls.script)
        shutil.copy(PROJECT / "platforms/android/package/references.xml", package)
        rules.write_text(RULES)
        (package / "exports-64.txt").write_text("JNI_OnLoad\nJava_korvel_Kit_call\nkeep\n")
        (package / "needed.txt").write_text("# a comment\nlibc.so\n")
        (package / "permissions.txt").write_text("android.permission.INTERNET\n")
        (package / "size.txt").write_text("x86_64 100000\n")
        cls.stubs = (cls.root / "ndk/toolchains/llvm/prebuilt/linux-x86_64/sysroot/usr/lib/"
                     "x86_64-linux-android/24")
        cls.stubs.mkdir(parents=True)
        cls.stub("libc.so", "void puts(){} void __memcpy_chk(){} void __stack_chk_fail(){}")
        # A newer libc to link with, and another library, neither of which API 24 has.
        cls.newer = cls.root / "newer"
        cls.newer.mkdir()
        cls.stub("libc.so", "void puts(){} void __memcpy_chk(){} void __stack_chk_fail(){}"
                            "void newer(){}", cls.newer)
        cls.stub("libextra.so", "void extra(){}", cls.newer)
        (cls.root / "java").mkdir()
        cls.classes = cls.compile("Kit", KIT)

    @classmethod
    def tearDownClass(cls):
        cls.scratch.cleanup()

    @classmethod
    def stub(cls, name, source, folder=None):
        run("gcc", "-w", "-fno-builtin", "-shared", "-nostdlib", "-fPIC", "-Wl,-soname," + name,
            "-x", "c", "-", "-o", (folder or cls.stubs) / name, input=source)

    @classmethod
    def compile(cls, name, source):
        folder = cls.root / "java" / name
        folder.mkdir()
        (folder / f"{name}.java").write_text(source)
        run("javac", "--release", "8", "-Xlint:-options", "-d", folder, folder / f"{name}.java")
        return folder

    def link(self, source=SOURCE, options=(), folder=None, names="JNI_OnLoad; Java_*; keep;",
             strip=("-s",)):
        script = self.root / "exports.map"
        script.write_text("{ global: " + names + " local: *; };")
        library = self.root / "library.so"
        folder = folder or self.stubs
        run("gcc", "-w", "-O1", "-fno-builtin", "-fno-stack-protector", "-shared", "-nostdlib",
            "-fPIC", *LINK, EXPORTS + str(script), *strip, *options, "-x", "c", "-", "-x", "none",
            folder / "libc.so", "-o", library, input=source)
        return library.read_bytes()

    def pack(self, library, classes=None, manifest=MANIFEST, rules=RULES, abi="x86_64",
             extra=None):
        archive = self.root / "kit.aar"
        jar = self.root / "classes.jar"
        with zipfile.ZipFile(jar, "w") as file:
            for each in sorted((classes or self.classes).rglob("*.class")):
                file.write(each, each.relative_to(classes or self.classes))
        with zipfile.ZipFile(archive, "w") as file:
            file.write(jar, "classes.jar")
            file.writestr("AndroidManifest.xml", manifest)
            file.writestr("proguard.txt", rules)
            file.writestr("R.txt", "")
            if library is not None:
                file.writestr(f"jni/{abi}/libKorvelTalvox.so", library)
            if extra:
                file.writestr(extra, "")
        return archive

    def check(self, archive, *arguments, ndk=True):
        environment = dict(os.environ, ANDROID_NDK_HOME=str(self.root / "ndk") if ndk else "")
        arguments = arguments or ["x86_64", "--without-references"]
        return subprocess.run(["/usr/bin/python3", self.script, archive, *arguments],
                              capture_output=True, text=True, env=environment, check=False)

    def failed_rows(self, archive):
        result = self.check(archive)
        rows = [re.split(r"  +", line)[0] for line in result.stdout.splitlines()
                if "FAILED" in line]
        self.assertEqual(1 if rows else 0, result.returncode, result.stdout + result.stderr)
        return rows

    def expect_library(self, row, **changes):
        self.assertEqual([row] if row else [], self.failed_rows(self.pack(self.link(**changes))))

    def test_a_good_archive(self):
        self.expect_library(None)

    def test_each_library_check(self):
        cases = {
            "exported symbols": {"source": MORE, "names": "JNI_OnLoad; Java_*; keep; inflate;"},
            "symbols of API 24": {"source": NEWER, "folder": self.newer},
            "16 KB pages": {"options": ["-Wl,-z,max-page-size=4096"]},
            "RELRO": {"options": ["-Wl,-z,norelro"]},
            "BIND_NOW": {"options": ["-Wl,-z,lazy"]},
            "stack not executable": {"options": ["-Wl,-z,execstack"]},
            "no run path": {"options": ["-Wl,-rpath,/lib"]},
            "build id": {"options": ["-Wl,--build-id=none"]},
            "stack protector": {"source": WITHOUT_PROTECTOR + "int keep;"},
            "FORTIFY": {"source": SMALL},
            "size": {"source": SOURCE + "static const char big[100000] = {1};"
                                        "const char *keep3(void) { return big; }"
                                        "const char *(*keep4)(void) = keep3;"},
        }
        for row, changes in cases.items():
            with self.subTest(row):
                self.expect_library(row, **changes)

    def test_a_library_that_api_24_does_not_have(self):
        library = self.link(options=["-Wl,--no-as-needed", str(self.newer / "libextra.so")])
        self.assertEqual(["needed libraries", "symbols of API 24"],
                         self.failed_rows(self.pack(library)))

    def test_text_relocations(self):
        library = self.link(options=["-Wl,-z,notext", "-mcmodel=large", "-fno-pic"])
        self.assertIn("no text relocation", self.failed_rows(self.pack(library)))

    def test_symbols_left_in(self):
        self.expect_library("stripped", strip=())

    def test_another_architecture(self):
        library = bytearray(self.link())
        library[18] = 183  # e_machine: AArch64
        self.assertIn("architecture", self.failed_rows(self.pack(bytes(library))))

    def test_each_archive_check(self):
        library = self.link()
        other = self.compile("Other", "package korvel; public class Other { native void call(); }")
        shutil.copytree(self.classes / "korvel", other / "korvel", dirs_exist_ok=True)
        cases = {
            "contents": {"extra": "jni/x86_64/libextra.so"},
            "JNI names and classes": {"classes": other},
            "keep rules": {"rules": "-keep class korvel.Gone { *; }\n"},
            "manifest": {"manifest": MANIFEST.replace("INTERNET", "CAMERA")},
            "minimum SDK": {"manifest": MANIFEST.replace('"24"', '"21"')},
        }
        for row, changes in cases.items():
            with self.subTest(row):
                self.assertEqual([row], self.failed_rows(self.pack(library, **changes)))

    def test_a_missing_library(self):
        self.assertEqual(["contents", "JNI names and classes"],
                         self.failed_rows(self.pack(None)))

    def test_a_class_above_api_24(self):
        newer = self.compile("Newer", "package korvel; class Newer {"
                                      " Object encoder = java.util.Base64.getEncoder(); }")
        shutil.copytree(self.classes / "korvel", newer / "korvel", dirs_exist_ok=True)
        good = self.check(self.pack(self.link()), "x86_64")
        result = self.check(self.pack(self.link(), classes=newer), "x86_64")
        if "cannot be compared" in result.stderr:
            self.skipTest("the Maven repository cannot be reached")
        self.assertEqual((0, ""), (good.returncode, good.stderr))
        self.assertIn("archive: classes of API 24: ", result.stderr)
        self.assertIn("java.util.Base64", result.stderr)

    def test_bad_input(self):
        good = self.pack(self.link())
        cases = {
            "check-android: unknown ABI: mips; there are arm64-v8a, armeabi-v7a, x86_64\n":
                self.check(good, "mips"),
            "check-android: unknown ABI: arm64; there are arm64-v8a, armeabi-v7a, x86_64\n":
                self.check("arm64"),
            f"check-android: {self.script.parent.parent}/build/java/korvel-talvox.aar cannot be "
            "read: [Errno 2] No such file or directory: "
            f"'{self.script.parent.parent}/build/java/korvel-talvox.aar'; ./dev aar makes it\n":
                self.check("x86_64", "--without-references"),
            "check-android: ANDROID_NDK_HOME is not the folder of an Android NDK\n":
                self.check(good, ndk=False),
        }
        for message, result in cases.items():
            self.assertEqual((2, message), (result.returncode, result.stderr))
        for broken in (self.root / "missing.aar", self.script):
            result = self.check(broken)
            self.assertEqual(2, result.returncode)
            self.assertIn("cannot be read", result.stderr)
        result = self.check(self.pack(b"no library"))
        self.assertEqual(2, result.returncode)
        self.assertIn("jni/x86_64/libKorvelTalvox.so is no ELF file", result.stderr)


if __name__ == "__main__":
    unittest.main()
