# SPDX-License-Identifier: MIT
"""Fetches the i386 builds of the Debian packages that scan_real_plugins.py scans, and the libraries they need.

    fetch_i386.py FOLDER [PACKAGE...]

Each package is unpacked to FOLDER/PACKAGE, all that they depend on to FOLDER/libraries, without the C and C++
runtimes, which g++-multilib supplies. Nothing is installed: apt works on lists and a cache of its own in
FOLDER/apt, for i386 alone, so neither the machine's packages nor its architectures change, and no rights are
needed. FOLDER/missing names the packages that the archive did not have, one a line, as happens when it does not match
its index; FOLDER/done says that there is nothing left to do. Exits with 1 when dpf-plugins-vst could not be fetched,
of which five modules need no library at all.
"""
import os
import pathlib
import re
import shutil
import subprocess
import sys

PACKAGES = ["amsynth", "dpf-plugins-vst", "dragonfly-reverb-vst", "iem-plugin-suite-vst", "lsp-plugins-vst",
            "zam-plugins", "zynaddsubfx-vst"]
LEAST = "dpf-plugins-vst"
FROM_THE_COMPILER = {"libc6", "libstdc++6", "libgcc-s1", "gcc-12-base"}

CONFIGURATION = """
#clear APT::Architectures;
#clear APT::Update::Post-Invoke;
#clear APT::Update::Post-Invoke-Success;
APT::Architecture "i386";
APT::Architectures {{ "i386"; }};
APT::Sandbox::User "";
Dir::State "{apt}";
Dir::State::status "{apt}/status";
Dir::Cache "{apt}/cache";
"""


class Apt:
    """apt as it would be on an i386 machine with nothing installed."""

    def __init__(self, folder):
        self.archives = folder / "cache/archives"
        (self.archives / "partial").mkdir(parents=True, exist_ok=True)
        (folder / "lists/partial").mkdir(parents=True, exist_ok=True)
        (folder / "status").touch()
        configuration = folder / "apt.conf"
        configuration.write_text(CONFIGURATION.format(apt=folder))
        self.environment = {**os.environ, "APT_CONFIG": str(configuration), "LC_ALL": "C"}

    def run(self, *arguments, **options):
        return subprocess.run(["apt-get", "-qq", *arguments], env=self.environment, stdin=subprocess.DEVNULL,
                              text=True, **options)

    def update(self):
        if self.run("update").returncode != 0:
            print("not every index could be fetched; going on with those that were")

    def fetch(self, packages):
        """Downloads packages with all that they depend on. {package: its file} of these, {} when apt refuses."""
        install = ["install", "-y", "--no-install-recommends", *packages]
        listed = self.run(*install, "--print-uris", stdout=subprocess.PIPE)
        files = re.findall(r"^'[^']+' (\S+\.deb) ", listed.stdout, re.MULTILINE)
        self.run(*install, "--download-only", "--fix-missing")
        return {file.partition("_")[0]: self.archives / file for file in files}


def fetch(folder, packages):
    apt = Apt(folder / "apt")
    apt.update()
    files = apt.fetch(packages)
    for package in packages:
        # A package whose libraries cannot be found must not keep apt from fetching the others.
        if package not in files:
            files = {**apt.fetch([package]), **files}

    missing = [package for package in packages if package not in files]
    for package, file in files.items():
        if package in FROM_THE_COMPILER:
            continue
        if file.exists():
            target = folder / (package if package in packages else "libraries")
            subprocess.run(["dpkg", "-x", file, target], check=True)
        else:
            missing.append(package)
    return missing


def main():
    folder = pathlib.Path(sys.argv[1]).absolute()
    packages = sys.argv[2:] or PACKAGES
    if (folder / "done").exists():
        return 0
    if shutil.which("apt-get") is None:
        print("no apt-get: the i386 packages cannot be fetched", file=sys.stderr)
        return 1
    shutil.rmtree(folder, ignore_errors=True)
    folder.mkdir(parents=True)
    missing = fetch(folder, packages)
    for package in missing:
        print(f"not fetched: {package}")
    (folder / "missing").write_text("".join(f"{package}\n" for package in missing))
    if LEAST in missing:
        print(f"{LEAST} is missing, so there is no 32-bit plug-in that is sure to load", file=sys.stderr)
        return 1
    if not missing:
        (folder / "done").touch()
    shutil.rmtree(folder / "apt")
    print(f"{len(packages)} packages and their libraries are in {folder}" if not missing else
          f"{len(missing)} of the packages and libraries are missing in {folder}")
    return 0


if __name__ == "__main__":
    sys.exit(main())
