"""Tests of the quick-start scripts: the package check that scripts/demo.sh, scripts/test.sh and
.ci/run share, and the test runner's refusal to pass without tests.

The scripts run for real, with fake dpkg-query, apt-get, id, cmake and ctest first on PATH: each
fake records how it was called, so nothing is installed and nothing is built.
"""

import os
import pathlib
import shutil
import subprocess
import sys
import tempfile
import unittest

SOURCE_DIR = pathlib.Path(os.environ.get("BLUELIGHT_SOURCE_DIR", pathlib.Path(__file__).parents[2]))
PACKAGE_LIST = SOURCE_DIR / "scripts" / "packages.txt"

FAKES = {
    # Reports the packages named in FAKE_INSTALLED as installed, and fails as dpkg-query does
    # when any package asked for is unknown.
    "dpkg-query": r"""#!/bin/sh
shift 2  # -W and the format, which holds a line break
echo "dpkg-query $*" >>"$FAKE_LOG"
status=0
for package in "$@"; do
  case " $FAKE_INSTALLED " in
    *" $package "*) echo "$package:install ok installed" ;;
    *) echo "dpkg-query: no packages found matching $package" >&2; status=1 ;;
  esac
done
exit $status
""",
    "apt-get": """#!/bin/sh
echo "apt-get $*" >>"$FAKE_LOG"
exit "${FAKE_APT_STATUS:-0}"
""",
    "id": """#!/bin/sh
echo "${FAKE_UID:-0}"
""",
    "cmake": """#!/bin/sh
echo "cmake $*" >>"$FAKE_LOG"
""",
    "ctest": """#!/bin/sh
echo "ctest $*" >>"$FAKE_LOG"
exit "${FAKE_CTEST_STATUS:-0}"
""",
}


def packages_of(*groups):
    """The packages of scripts/packages.txt that belong to the given groups, in file order."""
    names = []
    for line in PACKAGE_LIST.read_text().splitlines():
        fields = line.split()
        if fields and not fields[0].startswith("#") and fields[1] in groups:
            names.append(fields[0])
    return names


class ScriptTest(unittest.TestCase):
    def setUp(self):
        self.work = pathlib.Path(tempfile.mkdtemp(prefix="bluelight-scripts-"))
        self.addCleanup(shutil.rmtree, self.work)
        fakes = self.work / "bin"
        fakes.mkdir()
        for name, text in FAKES.items():
            path = fakes / name
            path.write_text(text)
            path.chmod(0o755)
        self.log = self.work / "calls.log"
        self.log.write_text("")
        self.env = {
            "PATH": f"{fakes}:{os.environ['PATH']}",
            "FAKE_LOG": str(self.log),
            "FAKE_INSTALLED": "",
            "FAKE_UID": "0",
        }

    def run_script(self, *command, **env):
        merged = dict(self.env)
        merged.update(env)
        return subprocess.run(
            [str(SOURCE_DIR / command[0]), *command[1:]],
            cwd=self.work,
            env=merged,
            capture_output=True,
            text=True,
            check=False,
        )

    def calls(self, program):
        return [line for line in self.log.read_text().splitlines() if line.split()[0] == program]


class EnsurePackagesTest(ScriptTest):
    def test_a_complete_machine_installs_nothing_and_prints_nothing(self):
        result = self.run_script(
            "scripts/ensure-packages.sh", "ci", FAKE_INSTALLED=" ".join(packages_of("demo", "test", "ci"))
        )
        self.assertEqual(result.returncode, 0, result.stderr)
        self.assertEqual(result.stdout, "")
        self.assertEqual(result.stderr, "")
        self.assertEqual(self.calls("apt-get"), [])
        # One question to dpkg for the whole list.
        self.assertEqual(len(self.calls("dpkg-query")), 1)

    def test_root_updates_once_then_installs_exactly_the_missing_packages(self):
        demo = packages_of("demo")
        installed = [p for p in demo if p != "nlohmann-json3-dev"]
        result = self.run_script("scripts/ensure-packages.sh", "demo", FAKE_INSTALLED=" ".join(installed))
        self.assertEqual(result.returncode, 0, result.stderr)
        self.assertEqual(
            self.calls("apt-get"),
            ["apt-get update -qq", "apt-get install -y -qq --no-install-recommends nlohmann-json3-dev"],
        )
        self.assertIn("installing the missing packages: nlohmann-json3-dev", result.stdout)

    def test_without_root_the_exact_line_is_printed_and_the_status_is_not_zero(self):
        result = self.run_script("scripts/ensure-packages.sh", "test", FAKE_UID="1000", FAKE_INSTALLED=" ".join(packages_of("demo")))
        self.assertEqual(result.returncode, 1)
        missing = " ".join(packages_of("test"))
        self.assertIn(f"these Debian packages are missing: {missing}\n", result.stderr)
        self.assertIn(
            f"  sudo apt-get update && sudo apt-get install -y --no-install-recommends {missing}\n",
            result.stderr,
        )
        self.assertEqual(self.calls("apt-get"), [])

    def test_the_demo_installs_only_what_the_demo_needs(self):
        result = self.run_script("scripts/ensure-packages.sh", "demo")
        self.assertEqual(result.returncode, 0, result.stderr)
        install = self.calls("apt-get")[-1].split()
        self.assertEqual(install[:5], ["apt-get", "install", "-y", "-qq", "--no-install-recommends"])
        self.assertEqual(install[5:], packages_of("demo"))
        self.assertEqual(
            packages_of("demo"), ["cmake", "g++", "make", "nlohmann-json3-dev", "gettext", "libsimdjson-dev"]
        )

    def test_each_command_includes_the_lists_it_builds_on(self):
        for group, expected in (
            ("test", packages_of("demo", "test")),
            ("ci", packages_of("demo", "test", "ci")),
        ):
            with self.subTest(group=group):
                self.log.write_text("")
                result = self.run_script("scripts/ensure-packages.sh", group)
                self.assertEqual(result.returncode, 0, result.stderr)
                self.assertEqual(self.calls("apt-get")[-1].split()[5:], expected)

    def test_a_failing_installation_fails_the_command(self):
        result = self.run_script("scripts/ensure-packages.sh", "demo", FAKE_APT_STATUS="100")
        self.assertNotEqual(result.returncode, 0)

    def test_an_unknown_command_name_is_a_usage_error(self):
        for arguments in ([], ["everything"], ["demo", "test"]):
            with self.subTest(arguments=arguments):
                result = self.run_script("scripts/ensure-packages.sh", *arguments)
                self.assertEqual(result.returncode, 2)
                self.assertIn("usage:", result.stderr)
                self.assertEqual(self.calls("apt-get"), [])


class QuickStartScriptsTest(ScriptTest):
    def complete(self):
        return " ".join(packages_of("demo", "test", "ci"))

    def test_the_test_script_switches_the_tests_on(self):
        result = self.run_script("scripts/test.sh", FAKE_INSTALLED=self.complete(), BUILD_DIR=str(self.work / "b"))
        self.assertEqual(result.returncode, 0, result.stderr)
        configure = self.calls("cmake")[0]
        self.assertIn("-DBLUELIGHT_BUILD_TESTS=ON", configure.split())

    def test_the_test_script_fails_when_no_test_runs(self):
        result = self.run_script("scripts/test.sh", FAKE_INSTALLED=self.complete(), BUILD_DIR=str(self.work / "b"))
        self.assertEqual(result.returncode, 0, result.stderr)
        self.assertIn("--no-tests=error", self.calls("ctest")[0].split())
        # ctest's status when it found no test (with --no-tests=error) is the script's status.
        result = self.run_script(
            "scripts/test.sh", FAKE_INSTALLED=self.complete(), BUILD_DIR=str(self.work / "b"), FAKE_CTEST_STATUS="8"
        )
        self.assertNotEqual(result.returncode, 0)

    def test_the_test_script_stops_before_building_when_packages_are_missing(self):
        result = self.run_script("scripts/test.sh", FAKE_UID="1000", BUILD_DIR=str(self.work / "b"))
        self.assertEqual(result.returncode, 1)
        self.assertIn("sudo apt-get update && sudo apt-get install", result.stderr)
        self.assertEqual(self.calls("cmake"), [])
        self.assertEqual(self.calls("ctest"), [])

    def test_the_demo_stops_before_building_when_packages_are_missing(self):
        result = self.run_script("scripts/demo.sh", FAKE_UID="1000", BUILD_DIR=str(self.work / "b"))
        self.assertEqual(result.returncode, 1)
        self.assertIn("these Debian packages are missing: " + " ".join(packages_of("demo")), result.stderr)
        self.assertEqual(self.calls("cmake"), [])

    def test_ci_uses_the_same_list(self):
        ci = (SOURCE_DIR / ".ci" / "run").read_text()
        self.assertIn("scripts/ensure-packages.sh ci\n", ci)
        self.assertNotIn("apt-get", ci)


if __name__ == "__main__":
    unittest.main(argv=sys.argv, verbosity=2)
