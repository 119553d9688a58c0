#!/usr/bin/env python3
"""The installer packages under Wine, in scratch prefixes of their own.

Installs the x64 package silently, compares the registry it wrote with what regsvr32 writes for
the same DLL at the same path (the REG_BINARY ShellFolder value included), lists the user's
stations through the shell from the installed DLL, upgrades to a newer package, uninstalls, and
checks that every file and key the package wrote is gone while the user's stations stay. Then the
x86 package the same way, in the 32-bit registry view.

Usage: package_test.py BUILD_DIR OLD_X64_MSI OLD_VERSION NEW_X64_MSI NEW_VERSION X86_MSI
Prints one line per check and "checks: N passed, M failed".
"""
import os
import re
import shutil
import subprocess
import sys

build = os.path.abspath(sys.argv[1])
old_x64, old_version, new_x64, new_version, x86 = sys.argv[2:7]
tools = os.path.join(build, "windows", "bin")
scratch = os.path.join(build, "package-test")
STATION = "Survey North"
PROGRAM_FILES = r"C:\Program Files\Quorvel\Digital Levels"
PROGRAM_FILES_X86 = r"C:\Program Files (x86)\Quorvel\Digital Levels"
results = []


def check(condition, what, detail=""):
    results.append(bool(condition))
    print(("ok: " if condition else "FAILED: ") + what)
    if not condition and detail:
        print("    " + detail.replace("\n", "\n    "))
    return condition


class Prefix:
    """A Wine prefix with its own server, created fresh."""

    def __init__(self, name):
        self.path = os.path.join(scratch, name)
        shutil.rmtree(self.path, ignore_errors=True)
        os.makedirs(self.path)
        self.env = dict(os.environ, WINEPREFIX=self.path, WINEARCH="win64", WINEDEBUG="-all",
                        WINEDLLOVERRIDES="mscoree,mshtml=")
        self.run(["wineboot", "--init"])
        self.run(["wineserver", "-w"])

    def run(self, command, timeout=300):
        return subprocess.run(command, env=self.env, capture_output=True, timeout=timeout,
                              text=True, errors="replace")

    def wine(self, *arguments):
        return self.run(["wine"] + list(arguments))

    def unix(self, windows_path):
        drive, rest = windows_path.split(":", 1)
        return os.path.join(self.path, "drive_" + drive.lower(), *rest.strip("\\").split("\\"))

    def registry(self):
        """Every key and value of HKLM\\Software, keyed by (lower-case key, lower-case name)."""
        export = os.path.join(self.path, "export.reg")
        self.wine("reg", "export", r"HKLM\Software", "Z:" + export.replace("/", "\\"), "/y")
        with open(export, encoding="utf-16") as file:
            text = file.read().replace("\\\n  ", "")
        entries, key = {}, None
        for line in text.splitlines():
            if line.startswith("["):
                key = line[1:-1]
                entries[(key.lower(), "")] = ""
            elif key and (match := re.match(r'^(@|"(?:[^"\\]|\\.)*")=(.*)$', line)):
                entries[(key.lower(), match.group(1).lower())] = match.group(2)
        return entries

    def stop(self):
        self.run(["wineserver", "-k"])


def written(before, after):
    """What a step added or changed, without the installer's own bookkeeping and without
    Wine's second name for the 32-bit classes (Software\\Wow6432Node\\Classes)."""
    def ours(key):
        return not re.search(r"\\installer(\\|$)|\\currentversion\\uninstall(\\|$)|"
                             r"^hkey_local_machine\\software\\wow6432node\\classes", key)
    return {entry: value for entry, value in after.items()
            if ours(entry[0]) and before.get(entry) != value}


def removed(before, after):
    """What a step deleted of what was there, apart from the installer's bookkeeping and from keys
    that held nothing (Wine's msiexec deletes a key that an uninstall leaves empty, even one that
    was there before, such as an empty Shell Extensions\\Approved)."""
    def held_values(key):
        return any(entry[1] and (entry[0] == key or entry[0].startswith(key + "\\"))
                   for entry in before)
    return sorted(entry for entry in before if entry not in after and
                  not re.search(r"\\installer(\\|$)", entry[0]) and
                  (entry[1] or held_values(entry[0])))


def values(entries):
    return {entry: value for entry, value in entries.items() if entry[1]}


def describe(difference):
    return "\n".join(f"{key} [{name}] = {value}" for (key, name), value in sorted(difference))[:3000]


def same(what, actual, expected):
    missing = set(expected.items()) - set(actual.items())
    extra = set(actual.items()) - set(expected.items())
    check(not missing and not extra, what,
          "missing:\n" + describe(missing) + "\nextra:\n" + describe(extra))


def view_32(entries):
    """The values of the 32-bit registry view, without the type library (one key that both
    modules share; checked separately)."""
    return {entry: value for entry, value in values(entries).items()
            if "wow6432node" in entry[0] and "\\typelib\\" not in entry[0]}


def to_32_bit_view(entries):
    """Self-registration of the same DLL as the x86 module writes it: the 32-bit view of the
    classes and of Software\\Microsoft, in the x86 program folder."""
    result = {}
    for (key, name), value in entries.items():
        key = key.replace("\\software\\classes\\", "\\software\\classes\\wow6432node\\")
        key = key.replace("\\software\\microsoft\\", "\\software\\wow6432node\\microsoft\\")
        result[(key, name)] = value.replace("Program Files\\\\", "Program Files (x86)\\\\")
    return result


def installed_products(prefix):
    """The installed products named "Quorvel Digital Levels", with their versions."""
    entries = prefix.registry()
    return {key: entries.get((key, '"displayversion"'), "")
            for (key, name), value in entries.items()
            if re.search(r"\\currentversion\\uninstall\\{[0-9a-f-]+}$", key) and
            name == '"displayname"' and value == '"Quorvel Digital Levels"'}


def msi(path):
    return "Z:" + os.path.abspath(path).replace("/", "\\")


TYPELIB = r"hkey_local_machine\software\classes\typelib\{b8d31c5f-2a67-4e9b-a4f1-5c09d7e82b36}\1.0"

# What self-registration writes: the stripped x64 DLL at the package's path, through regsvr32.
reference = Prefix("regsvr32")
dll = reference.unix(PROGRAM_FILES + r"\LVShellExt.dll")
os.makedirs(os.path.dirname(dll))
shutil.copy(os.path.join(build, "package", "stage", "x64", "LVShellExt.dll"), dll)
before = reference.registry()
check(reference.wine("regsvr32", "/s", PROGRAM_FILES + r"\LVShellExt.dll").returncode == 0,
      "regsvr32 registers the x64 DLL in a scratch prefix")
registered = written(before, reference.registry())
reference.stop()
check(registered.get((r"hkey_local_machine\software\classes\clsid"
                      r"\{7d3f2a61-4b8e-4c19-9a27-5e0c81b6d4f3}\shellfolder", '"attributes"'))
      == "hex:00,00,00,a0", "regsvr32 writes the ShellFolder Attributes as REG_BINARY 00 00 00 A0")

prefix = Prefix("install")
check(prefix.wine(os.path.join(tools, "lvstations.exe"), "add", STATION, "--port", "COM1",
                  "--baud", "9600", "--parity", "even", "--model", "Quorvel LV-10").returncode == 0,
      f"the user has a station \"{STATION}\" before the package comes")
clean = prefix.registry()

# Install the older x64 package.
check(prefix.wine("msiexec", "/i", msi(old_x64), "/qn").returncode == 0,
      "msiexec /i installs the x64 package silently")
after = prefix.registry()
package = written(clean, after)
files = {
    PROGRAM_FILES: ["LVShellExt.dll", "lvcopy.exe", "lvrecv.exe", "lvstations.exe",
                    r"de-DE\ShellExt.txt", "README.html", "User guide.html",
                    "Benutzerhandbuch.html"],
    PROGRAM_FILES_X86: ["LVShellExt.dll", r"de-DE\ShellExt.txt"],
}
for folder, names in files.items():
    missing = [name for name in names if not os.path.isfile(prefix.unix(folder + "\\" + name))]
    check(not missing, f"{folder} holds {', '.join(names)}", f"missing: {missing}")
pictures = os.listdir(prefix.unix(PROGRAM_FILES + r"\guide"))
check(pictures and all(name.endswith(".png") for name in pictures),
      f"the guides' {len(pictures)} pictures are installed beside them")
check(not any("halvekcomm" in name.lower()
              for folder in (r"C:\Program Files", r"C:\Program Files (x86)")
              for _, _, names in os.walk(prefix.unix(folder)) for name in names),
      "the substitute external library is not installed")
for folder in (PROGRAM_FILES, PROGRAM_FILES_X86):
    path = prefix.unix(folder + r"\LVShellExt.dll")
    size = os.path.getsize(path)
    sections = subprocess.run(["x86_64-w64-mingw32-objdump", "-h", path], capture_output=True,
                              text=True).stdout
    check(size < 1024 * 1024 and ".debug_" not in sections,
          f"{folder}\\LVShellExt.dll is stripped and under 1 MiB ({size:,} bytes)")

# The 64-bit view equals self-registration; the x86 module's type library path is the one
# entry of the shared type-library key that belongs to the other module. (Wine's RegisterTypeLib
# also copies the library into the 32-bit view, where the x86 module's registration replaces it.)
win32 = (TYPELIB + r"\0\win32", "@")
view64 = {entry: value for entry, value in package.items()
          if "wow6432node" not in entry[0] and entry[0] != win32[0]}
same("the x64 registration equals regsvr32's, key by key and value by value", view64,
     {entry: value for entry, value in registered.items() if "wow6432node" not in entry[0]})
same("the x86 registration in the 32-bit view equals regsvr32's for the x86 path",
     view_32(package), view_32(to_32_bit_view(registered)))
check(package.get(win32) == '"' + PROGRAM_FILES_X86.replace("\\", "\\\\") + '\\\\LVShellExt.dll"',
      "the type library names the x86 module for win32")

listing = prefix.wine(os.path.join(tools, "lvbrowse.exe"))
check(listing.returncode == 0 and STATION in listing.stdout,
      "the folder lists the user's station through the shell from the installed DLL",
      listing.stdout + listing.stderr)
check(list(installed_products(prefix).values()) == [f'"{old_version}"'],
      f"one product is installed, version {old_version}", str(installed_products(prefix)))

# Upgrade: the newer package replaces the older one.
check(prefix.wine("msiexec", "/i", msi(new_x64), "/qn").returncode == 0,
      "msiexec /i installs the newer x64 package over the older one")
products = installed_products(prefix)
check(list(products.values()) == [f'"{new_version}"'],
      f"after the upgrade one product is installed, version {new_version}", str(products))
same("the upgraded registration is the same", written(clean, prefix.registry()), package)

# Uninstall: every file and key the package wrote goes; the user's stations stay.
check(prefix.wine("msiexec", "/x", msi(new_x64), "/qn").returncode == 0,
      "msiexec /x removes the x64 package")
left = written(clean, prefix.registry())
check(not left, "no key or value the package wrote is left", describe(left.items()))
check(not removed(clean, prefix.registry()), "nothing that was there before is gone",
      str(removed(clean, prefix.registry())[:20]))
for folder in (r"C:\Program Files\Quorvel", r"C:\Program Files (x86)\Quorvel"):
    check(not os.path.exists(prefix.unix(folder)), f"{folder} is gone")
stations = prefix.wine(os.path.join(tools, "lvstations.exe"), "list")
check(STATION in stations.stdout, "the user's station is still there", stations.stdout)
check(STATION not in prefix.wine(os.path.join(tools, "lvbrowse.exe")).stdout,
      "the shell no longer shows the folder")
check(not installed_products(prefix), "no product is left installed")

# The x86 package, for 32-bit Windows: here it goes to the 32-bit folder and registry view.
check(prefix.wine("msiexec", "/i", msi(x86), "/qn").returncode == 0,
      "msiexec /i installs the x86 package silently")
package32 = written(clean, prefix.registry())
installed = [name for name in ["LVShellExt.dll", "lvcopy.exe", "lvrecv.exe", "lvstations.exe",
                               r"de-DE\ShellExt.txt", "User guide.html"]
             if os.path.isfile(prefix.unix(PROGRAM_FILES_X86 + "\\" + name))]
check(len(installed) == 6, f"{PROGRAM_FILES_X86} holds the x86 extension, tools and guides",
      str(installed))
same("the x86 package's registration in the 32-bit view equals regsvr32's for the x86 path",
     view_32(package32), view_32(to_32_bit_view(registered)))
check(prefix.wine("msiexec", "/x", msi(x86), "/qn").returncode == 0,
      "msiexec /x removes the x86 package")
left = written(clean, prefix.registry())
check(not left and not os.path.exists(prefix.unix(r"C:\Program Files (x86)\Quorvel")),
      "the x86 package leaves nothing behind", describe(left.items()))
prefix.stop()

print(f"checks: {sum(results)} passed, {len(results) - sum(results)} failed")
sys.exit(0 if all(results) else 1)
