#!/usr/bin/env python3
"""Shows that each check of scripts/check-maven fails on a repository that is spoilt for it alone.

The repository is a small one; its module metadata is written by scripts/maven-metadata.
"""

import io
import re
import subprocess
import tempfile
import unittest
import zipfile
from pathlib import Path

PROJECT = Path(__file__).resolve().parent.parent.parent
VERSION = "1"
ARTEFACTS = {
    "talvox": ("aar", ["org.jspecify:jspecify"]),
    "talvox-testing": ("jar", ["org.korvel:talvox"]),
    "talvox-ktx": ("jar", ["org.korvel:talvox", "org.jetbrains.kotlin:kotlin-stdlib",
                           "org.jetbrains.kotlinx:kotlinx-coroutines-core-jvm"]),
}


def pack(files):
    data = io.BytesIO()
    with zipfile.ZipFile(data, "w") as archive:
        for name, content in files.items():
            archive.writestr(name, content)
    return data.getvalue()


def pom(name, packaging, dependencies):
    entries = "".join(
        "<dependency><groupId>{}</groupId><artifactId>{}</artifactId><version>1</version>"
        "</dependency>".format(*each.split(":")) for each in dependencies)
    return (f'<project xmlns="http://maven.apache.org/POM/4.0.0">'
            f"<!-- do_not_remove: published-with-gradle-metadata -->"
            f"<groupId>org.korvel</groupId><artifactId>{name}</artifactId>"
            f"<version>{VERSION}</version><packaging>{packaging}</packaging>"
            f"<dependencies>{entries}</dependencies></project>")


class CheckMavenTest(unittest.TestCase):
    def setUp(self):
        scratch = tempfile.TemporaryDirectory()
        self.addCleanup(scratch.cleanup)
        self.repository = Path(scratch.name)
        for name, (packaging, dependencies) in ARTEFACTS.items():
            self.publish(name, packaging, dependencies)
        self.describe()

    def path(self, name, ending):
        return self.repository / "org/korvel" / name / VERSION / f"{name}-{VERSION}{ending}"

    def publish(self, name, packaging, dependencies, content=b"class"):
        self.path(name, "").parent.mkdir(parents=True, exist_ok=True)
        classes = pack({"korvel/Kit.class": content})
        main = pack({"classes.jar": classes}) if packaging == "aar" else classes
        self.path(name, f".{packaging}").write_bytes(main)
        self.path(name, "-sources.jar").write_bytes(pack({"korvel/Kit.java": ""}))
        self.path(name, "-javadoc.jar").write_bytes(pack({"index.html": ""}))
        self.path(name, ".pom").write_text(pom(name, packaging, dependencies))

    def describe(self):
        subprocess.run([PROJECT / "scripts/maven-metadata", self.repository], check=True)

    def replace(self, name, ending, old, new):
        path = self.path(name, ending)
        text = path.read_text()
        self.assertIn(old, text)
        path.write_text(text.replace(old, new, 1))

    def expect(self, *complaints):
        result = subprocess.run([PROJECT / "scripts/check-maven", self.repository],
                                capture_output=True, text=True, check=False)
        found = [re.sub("^check-maven: ", "", line) for line in result.stderr.splitlines()]
        self.assertEqual(list(complaints), found)
        self.assertEqual(1 if complaints else 0, result.returncode)
        self.assertEqual(len(complaints), result.stdout.count("FAILED"))

    def test_a_good_repository(self):
        self.expect()

    def test_a_missing_file(self):
        self.path("talvox-testing", ".module").unlink()
        self.expect("talvox-testing: files: missing: talvox-testing-1.module")

    def test_sources_of_other_classes(self):
        self.path("talvox", "-sources.jar").write_bytes(pack({"korvel/other/Kit.java": ""}))
        self.describe()
        self.expect("talvox: sources: no source of korvel/Kit.class")

    def test_an_empty_reference(self):
        self.path("talvox-ktx", "-javadoc.jar").write_bytes(pack({"note.txt": ""}))
        self.describe()
        self.expect("talvox-ktx: reference: has no index.html")

    def test_a_pom_without_the_marker(self):
        self.replace("talvox", ".pom", "do_not_remove", "removed")
        self.expect("talvox: POM: does not say that there is module metadata")

    def test_a_further_dependency(self):
        self.publish("talvox", "aar", ["org.jspecify:jspecify", "junit:junit"])
        self.describe()
        self.expect("talvox: POM: depends on ['jspecify', 'junit']")

    def test_metadata_of_another_artefact(self):
        self.replace("talvox-ktx", ".module", '"module": "talvox-ktx"', '"module": "talvox"')
        self.expect("talvox-ktx: module: component: is of org.korvel:talvox:1")

    def test_a_missing_variant(self):
        self.replace("talvox-ktx", ".module", '"org.gradle.docstype": "javadoc"', '"other": "x"')
        self.expect("talvox-ktx: module: variants: are ['apiElements', 'javadocElements', "
                    "'runtimeElements', 'sourcesElements']")

    def test_a_file_that_was_replaced(self):
        self.path("talvox", "-javadoc.jar").write_bytes(pack({"index.html": "newer"}))
        self.expect("talvox: module: digests: do not fit talvox-1-javadoc.jar")

    def test_another_version_of_a_dependency(self):
        self.replace("talvox", ".module", '"requires": "1"', '"requires": "2"')
        self.expect("talvox: module: dependencies: of apiElements are not those of the POM")

    def test_kotlin_in_a_java_artefact(self):
        self.publish("talvox-testing", "jar", ["org.korvel:talvox"], b"Lkotlin/Unit;")
        self.describe()
        self.expect("talvox-testing: no Kotlin in Java: korvel/Kit.class names Kotlin")


if __name__ == "__main__":
    unittest.main()
