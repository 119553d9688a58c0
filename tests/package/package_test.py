#!/usr/bin/env python3
"""The installer packages: their signatures, and the packages under Wine in scratch prefixes.

First the signatures: every DLL and EXE in both packages (taken out with msiextract) and the
packages themselves carry a valid SHA-256 Authenticode signature by the test certificate, the
signed binaries still match their symbol files, and a binary with one byte changed fails. Then
the folder lock that both packages carry (their MsiLockPermissionsEx rows, read with msiinfo).

Then installs the x64 package silently, compares the registry it wrote with what regsvr32 writes
for the same DLL at the same path (the REG_BINARY ShellFolder value included), checks the files and
the Start-menu shortcuts, lists the user's stations through the shell from the installed DLL,
upgrades to a newer package, refuses the older one back, uninstalls, and checks that every file,
shortcut and key the package wrote is gone while the user's stations stay. The x86 package refuses
this 64-bit Windows and installs nothing; a copy without that refusal shows its registration in
the 32-bit view. Then an install to another folder (INSTALLDIR) with a verbose log and its ACL
as icacls shows it (where Wine shows it), and last the x86 package's refusal as a user sees it
(with /qb, on the virtual display).

Usage: package_test.py --make-certificate DIR
           writes a throwaway code-signing certificate: DIR/signing.pem, DIR/signing.pfx and
           its password in DIR/password, for LV_SIGN_PFX and LV_SIGN_PASSWORD of scripts/package
       package_test.py BUILD_DIR OLD_X64_MSI OLD_VERSION NEW_X64_MSI NEW_VERSION X86_MSI CERTIFICATE
           CERTIFICATE: the signing.pem that the packages were signed with
Prints one line per check and "checks: N passed, M failed".
"""
import glob
import os
import re
import secrets
import shutil
import subprocess
import sys
import time
import zlib

import folder_lock


def make_certificate(folder):
    """A self-signed certificate for code signing only, valid for a week, in a PKCS#12 file."""
    shutil.rmtree(folder, ignore_errors=True)
    os.makedirs(folder)
    password = secrets.token_hex(16)
    with open(os.open(os.path.join(folder, "password"), os.O_WRONLY | os.O_CREAT, 0o600),
              "w") as file:
        file.write(password)
    pem, key = os.path.join(folder, "signing.pem"), os.path.join(folder, "signing.key")
    subprocess.run(["openssl", "req", "-x509", "-newkey", "rsa:2048", "-nodes", "-days", "7",
                    "-subj", "/CN=LVShellExt package test", "-keyout", key, "-out", pem,
                    "-addext", "keyUsage=critical,digitalSignature",
                    "-addext", "extendedKeyUsage=codeSigning"], check=True, capture_output=True)
    subprocess.run(["openssl", "pkcs12", "-export", "-inkey", key, "-in", pem,
                    "-out", os.path.join(folder, "signing.pfx"), "-passout", "env:LV_PFX_PASSWORD"],
                   check=True, capture_output=True, env=dict(os.environ, LV_PFX_PASSWORD=password))


if sys.argv[1:2] == ["--make-certificate"]:
    make_certificate(sys.argv[2])
    sys.exit(0)

build = os.path.abspath(sys.argv[1])
old_x64, old_version, new_x64, new_version, x86, certificate = sys.argv[2:8]
root = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))
tools = os.path.join(build, "windows", "bin")
scratch = os.path.join(build, "package-test")
STATION = "Survey North"
PROGRAM_FILES = r"C:\Program Files\Quorvel\Digital Levels"
PROGRAM_FILES_X86 = r"C:\Program Files (x86)\Quorvel\Digital Levels"
OTHER_FOLDER = r"C:\Tools\Levels"
START_MENU_FOLDER = "Quorvel Digital Levels"
GUIDES = {"User guide": "User guide.html", "Benutzerhandbuch": "Benutzerhandbuch.html",
          "Administrator's guide": "Administrator's guide.html",
          "Administratorhandbuch": "Administratorhandbuch.html"}
KEPT_DOWNLOADS = "Kept downloads"
BINARIES = ["LVShellExt.dll", "lvcopy.exe", "lvrecv.exe", "lvstations.exe"]
results = []


def check(condition, what, detail=""):
    results.append(bool(condition))
    print(("ok: " if condition else "FAILED: ") + what)
    if not condition and detail:
        print("    " + detail.replace("\n", "\n    "))
    return condition


def file_bytes(path):
    """The file's bytes; none when it is absent."""
    if not os.path.isfile(path):
        return b""
    with open(path, "rb") as file:
        return file.read()


class Prefix:
    """A Wine prefix with its own server, created fresh."""

    def __init__(self, name):
        self.path = os.path.join(scratch, name)
        shutil.rmtree(self.path, ignore_errors=True)
        os.makedirs(self.path)
        # Shortcuts made here stay in the prefix: no menu entries for this machine's desktop.
        self.env = dict(os.environ, WINEPREFIX=self.path, WINEARCH="win64", WINEDEBUG="-all",
                        WINEDLLOVERRIDES="mscoree,mshtml=;winemenubuilder.exe=d")
        self.run(["wineboot", "--init"])
        self.run(["wineserver", "-w"])
        # Wine hands a Unix parent only the low byte of a Windows exit code (1603 arrives as 67):
        # a batch file tells the whole code, as a deployment script would read it.
        with open(self.unix(r"C:\msiexec-code.bat"), "w", newline="\r\n") as file:
            file.write("@msiexec %*\n@echo msiexec exit code %errorlevel%\n")

    def run(self, command, timeout=300):
        return subprocess.run(command, env=self.env, capture_output=True, timeout=timeout,
                              text=True, errors="replace")

    def wine(self, *arguments):
        return self.run(["wine"] + list(arguments))

    def msiexec_started(self, *arguments):
        """msiexec with these arguments, running; msiexec_code() waits for its exit code."""
        return subprocess.Popen(["wine", "cmd", "/c", r"C:\msiexec-code.bat"] + list(arguments),
                                env=self.env, stdout=subprocess.PIPE, stderr=subprocess.STDOUT,
                                text=True, errors="replace")

    @staticmethod
    def msiexec_code(started, timeout=300):
        output = started.communicate(timeout=timeout)[0]
        match = re.search(r"msiexec exit code (-?\d+)", output)
        return int(match.group(1)) if match else None

    def msiexec(self, *arguments):
        """msiexec's exit code, as Windows gives it."""
        return self.msiexec_code(self.msiexec_started(*arguments))

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


def image_format(path):
    """objdump's name for a PE file's format: pei-x86-64 or pei-i386."""
    output = subprocess.run(["x86_64-w64-mingw32-objdump", "-f", path], capture_output=True,
                            text=True).stdout
    match = re.search(r"file format (\S+)", output)
    return match.group(1) if match else "unknown"


def extracted_binaries(package, folder):
    """Every DLL and EXE that PACKAGE installs, taken out of it: {(format, name): path}."""
    shutil.rmtree(folder, ignore_errors=True)
    os.makedirs(folder)
    subprocess.run(["msiextract", "-C", folder, package], check=True, capture_output=True)
    found = {}
    for directory, _, names in os.walk(folder):
        for name in names:
            if name.lower().endswith((".dll", ".exe")):
                path = os.path.join(directory, name)
                found[(image_format(path), name)] = path
    return found


def certificate_serial():
    output = subprocess.run(["openssl", "x509", "-in", certificate, "-noout", "-serial"],
                            capture_output=True, text=True, check=True).stdout
    return output.strip().split("=", 1)[1].upper()


SERIAL = certificate_serial()


def signature_problems(path):
    """What is wrong with PATH's Authenticode signature, judged with the test certificate as the
    only trusted root: nothing when it is valid, by that certificate, over a SHA-256 digest."""
    result = subprocess.run(["osslsigncode", "verify", "-CAfile", certificate, "-in", path],
                            capture_output=True, text=True, errors="replace")
    output = result.stdout + result.stderr
    problems = []
    if result.returncode != 0 or "Signature verification: ok" not in output:
        problems.append("the signature does not verify")
    signers = set(re.findall(r"Serial : ([0-9A-Fa-f]+)", output))
    if signers != {SERIAL}:
        problems.append(f"signed by {sorted(signers)}, not by the test certificate {SERIAL}")
    if not re.search(r"Message digest algorithm\s*:\s*SHA256", output):
        problems.append("the digest is not SHA-256")
    return problems, output


def debuglink(path):
    """The symbol file that a stripped PE file names, and the CRC-32 it expects of it."""
    dump = subprocess.run(["x86_64-w64-mingw32-objdump", "-s", "-j", ".gnu_debuglink", path],
                          capture_output=True, text=True).stdout
    # Each line: the address, up to four groups of eight hexadecimal digits (35 columns), text.
    data = b"".join(bytes.fromhex(line.split(" ", 2)[2][:35].replace(" ", ""))
                    for line in dump.splitlines() if re.match(r"^ [0-9a-f]+ ", line))
    if b"\0" not in data:
        return None, None
    name = data[:data.index(b"\0")].decode()
    offset = (len(name) + 1 + 3) // 4 * 4
    return name, int.from_bytes(data[offset:offset + 4], "little")


def crc32(path):
    return zlib.crc32(file_bytes(path))


# Signatures: every binary that either package installs, and the packages.
expected_binaries = {
    "x64": {("pei-x86-64", name) for name in BINARIES} | {("pei-i386", "LVShellExt.dll")},
    "x86": {("pei-i386", name) for name in BINARIES},
}
binaries = {}
for arch, package in (("x64", old_x64), ("x86", x86)):
    binaries[arch] = extracted_binaries(package, os.path.join(scratch, "extracted", arch))
    check(set(binaries[arch]) == expected_binaries[arch],
          f"the {arch} package holds {len(expected_binaries[arch])} binaries: "
          + ", ".join(f"{name} ({form})" for form, name in sorted(expected_binaries[arch])),
          f"found: {sorted(binaries[arch])}")
    for (form, name), path in sorted(binaries[arch].items()):
        problems, output = signature_problems(path)
        check(not problems, f"{arch} package: {name} ({form}) is signed by the test certificate, "
              "SHA-256, and verifies", "; ".join(problems) + "\n" + output[-1500:])
for package in (old_x64, new_x64, x86):
    problems, output = signature_problems(package)
    check(not problems, f"{os.path.basename(package)} is signed by the test certificate, "
          "SHA-256, and verifies", "; ".join(problems) + "\n" + output[-1500:])

# The symbol files kept for support still belong to the signed binaries.
for arch, form in (("x64", "pei-x86-64"), ("x86", "pei-i386")):
    mismatched = []
    for name in BINARIES:
        link, expected_crc = debuglink(binaries[arch].get((form, name), ""))
        symbols = os.path.join(build, "package", "symbols", arch, link or "?")
        if link != name + ".debug" or not os.path.isfile(symbols) or crc32(symbols) != expected_crc:
            mismatched.append(f"{name} names {link!r} with CRC {expected_crc}")
    check(not mismatched, f"each signed {arch} binary names its symbol file in "
          f"package/symbols/{arch}, and the file's checksum matches", "\n".join(mismatched))

# One byte changed in a signed DLL: the same check must refuse it.
original = binaries["x64"][("pei-x86-64", "LVShellExt.dll")]
tampered = os.path.join(scratch, "extracted", "LVShellExt-one-byte-changed.dll")
with open(original, "rb") as file:
    data = bytearray(file.read())
data[len(data) // 2] ^= 0x01
with open(tampered, "wb") as file:
    file.write(data)
problems, output = signature_problems(tampered)
check(problems and "MISMATCH" in output,
      "a copy of the signed x64 LVShellExt.dll with one byte changed fails the check "
      "(its digest no longer matches)", output[-1500:])

# The folder lock: each package protects every folder it installs into, INSTALLDIR above all,
# wherever an administrator puts it (a folder under a drive root inherits the root's write rights).
for arch, package, install_folders in (("x64", old_x64, ["INSTALLDIR", "INSTALLDIR32"]),
                                       ("x86", x86, ["INSTALLDIR"])):
    problems, locks = folder_lock.lock_problems(package, install_folders)
    check(locks and not problems,
          f"the {arch} package locks {' and '.join(install_folders)} and every folder it installs "
          "files into (MsiLockPermissionsEx through CreateFolder): protected, administrators and "
          "SYSTEM full control, users read and execute", "\n".join(problems))
# The check sees what a weaker lock would leave: the parent's ACEs, users' write rights, another
# account, a name instead of a SID.
weaker = {
    "not protected": "D:AI(A;OICI;FA;;;SY)(A;OICI;FA;;;BA)(A;OICI;0x1200a9;;;BU)",
    "users may modify": "D:PAI(A;OICI;FA;;;SY)(A;OICI;FA;;;BA)(A;OICI;0x1301bf;;;BU)",
    "authenticated users too": "D:PAI(A;OICI;FA;;;SY)(A;OICI;FA;;;BA)(A;OICI;0x1200a9;;;BU)"
                               "(A;OICI;FA;;;AU)",
    "files not covered": "D:PAI(A;CI;FA;;;SY)(A;CI;FA;;;BA)(A;CI;0x1200a9;;;BU)",
}
passed = [name for name, sddl in weaker.items() if not folder_lock.sddl_problems(sddl)]
check(not passed, "the lock check refuses an ACL that is " + ", ".join(weaker),
      f"passed: {passed}")


TYPELIB = r"hkey_local_machine\software\classes\typelib\{b8d31c5f-2a67-4e9b-a4f1-5c09d7e82b36}\1.0"
CLSID = r"hkey_local_machine\software\classes\clsid\{7d3f2a61-4b8e-4c19-9a27-5e0c81b6d4f3}"


def registry_path(windows_path):
    """A path as a value of the registry export shows it."""
    return '"' + windows_path.replace("\\", "\\\\") + '"'


def start_menu_folders(prefix):
    """The package's Start-menu folders in the prefix. A per-machine package belongs in the
    Start menu of all users (ProgramData); Wine's msiexec puts it in the installing user's
    (AppData\\Roaming): both are searched."""
    drive = prefix.unix("C:")
    patterns = [os.path.join(drive, "ProgramData", "Microsoft", "Windows", "Start Menu",
                             "Programs", START_MENU_FOLDER),
                os.path.join(drive, "users", "*", "AppData", "Roaming", "Microsoft", "Windows",
                             "Start Menu", "Programs", START_MENU_FOLDER)]
    return sorted(path for pattern in patterns for path in glob.glob(pattern))


def check_shortcuts(prefix, folder):
    """One shortcut to each guide, in one Start-menu folder, each naming the guide's installed
    file in FOLDER."""
    found = start_menu_folders(prefix)
    names = sorted(os.listdir(found[0])) if len(found) == 1 else []
    wrong = []
    for name, target in GUIDES.items():
        link = os.path.join(found[0], name + ".lnk") if found else ""
        if (folder + "\\" + target).encode("latin-1") not in file_bytes(link):
            wrong.append(name)
    kept = file_bytes(os.path.join(found[0], KEPT_DOWNLOADS + ".lnk") if found else "")
    # The rundll32 of the extension's bitness: in a 64-bit prefix the x86 package's is SysWOW64's.
    system = "syswow64" if folder == PROGRAM_FILES_X86 else "system32"
    if not (f"\\{system}\\rundll32.exe".encode() in kept.lower() and
            f'"{folder}\\LVShellExt.dll",OpenKeptDownloads'.encode("utf-16-le") in kept):
        wrong.append(KEPT_DOWNLOADS)
    check(names == sorted(name + ".lnk" for name in list(GUIDES) + [KEPT_DOWNLOADS]) and not wrong,
          f"the Start-menu folder \"{START_MENU_FOLDER}\" has a shortcut to each guide in "
          f"{folder}: {', '.join(GUIDES)}, and \"{KEPT_DOWNLOADS}\" runs the extension in it",
          f"folders: {found}\nshortcuts: {names}\nnot naming their target: {wrong}")


def check_kept_downloads_entry(prefix):
    """The Start-menu entry "Kept downloads", opened as a user opens it, before any download: the
    user's folder is made and a window shows it. The window is closed again, so that the
    uninstall after it finds nothing of the package in use."""
    found = start_menu_folders(prefix)
    link = os.path.join(found[0], KEPT_DOWNLOADS + ".lnk") if found else ""
    # No pipes: the window's process inherits them and keeps them open. start returns once the
    # shortcut is launched, not when rundll32 ends: the folder and the window are waited for.
    started = subprocess.run(["wine", "start", "/unix", link], env=prefix.env,
                             stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL, timeout=60)
    made, shown = [], False
    for _ in range(60):
        made = glob.glob(os.path.join(prefix.unix("C:"), "users", "*", "AppData", "Local",
                                      "Quorvel", "Digital Levels", "Downloads"))
        shown = '"Downloads": ("explorer.exe"' in subprocess.run(
            ["xwininfo", "-root", "-tree"], capture_output=True, text=True, errors="replace").stdout
        if made and shown:
            break
        time.sleep(0.5)
    check(started.returncode == 0 and len(made) == 1 and os.path.isdir(made[0]) and shown,
          f"the Start-menu entry \"{KEPT_DOWNLOADS}\" makes the user's folder of kept downloads "
          "and opens it in a window",
          f"exit code of start {started.returncode}\nfolders: {made}\nwindow shown: {shown}")
    # Asked to close (WM_CLOSE), as a user closes it.
    subprocess.run(["wine", "taskkill", "/im", "explorer.exe"], env=prefix.env,
                   stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL, timeout=60)


def text_file(path):
    """A text file that may be UTF-16 (with its byte-order mark) or 8-bit; empty when absent."""
    data = file_bytes(path)
    return data.decode("utf-16" if data[:2] == b"\xff\xfe" else "latin-1", errors="replace")


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
check(registered.get((CLSID + r"\shellfolder", '"attributes"')) == "hex:00,00,00,a0",
      "regsvr32 writes the ShellFolder Attributes as REG_BINARY 00 00 00 A0")

prefix = Prefix("install")
check(prefix.wine(os.path.join(tools, "lvstations.exe"), "add", STATION, "--port", "COM1",
                  "--baud", "9600", "--parity", "even", "--model", "Quorvel LV-10").returncode == 0,
      f"the user has a station \"{STATION}\" before the package comes")
clean = prefix.registry()

# Install the older x64 package.
check(prefix.msiexec("/i", msi(old_x64), "/qn") == 0,
      "msiexec /i installs the x64 package silently (exit code 0)")
after = prefix.registry()
package = written(clean, after)
files = {
    PROGRAM_FILES: BINARIES + [r"de-DE\ShellExt.txt", "ReadMe.txt"] + list(GUIDES.values()),
    PROGRAM_FILES_X86: ["LVShellExt.dll", r"de-DE\ShellExt.txt"],
}
for folder, names in files.items():
    missing = [name for name in names if not os.path.isfile(prefix.unix(folder + "\\" + name))]
    check(not missing, f"{folder} holds {', '.join(names)}", f"missing: {missing}")
readme = file_bytes(os.path.join(root, "res", "package", "ReadMe.txt")).replace(b"\n", b"\r\n")
check(readme and file_bytes(prefix.unix(PROGRAM_FILES + r"\ReadMe.txt")) == readme and
      not os.path.exists(prefix.unix(PROGRAM_FILES + r"\README.html")),
      "ReadMe.txt is the users' ReadMe (res/package/ReadMe.txt, with CR LF line ends); the "
      "developers' README is not installed")
pictures = os.listdir(prefix.unix(PROGRAM_FILES + r"\guide"))
check(pictures and all(name.endswith(".png") for name in pictures),
      f"the guides' {len(pictures)} pictures are installed beside them")
admin_pictures = sorted(os.listdir(os.path.join(root, "docs", "admin")))
missing = [name for name in admin_pictures
           if not os.path.isfile(prefix.unix(PROGRAM_FILES + r"\admin" + "\\" + name))]
check(admin_pictures and not missing,
      f"the administrator's guides' pictures are installed in admin: {', '.join(admin_pictures)}",
      f"missing: {missing}")
for guide in ("Administrator's guide.html", "Administratorhandbuch.html"):
    with open(prefix.unix(PROGRAM_FILES + "\\" + guide), encoding="utf-8") as file:
        page = file.read()
    check("<h1>" in page and 'src="admin/x86-refused.png"' in page and "INSTALLDIR" in page,
          f"{guide} is the administrator's guide as HTML, with its picture")
check_shortcuts(prefix, PROGRAM_FILES)
if os.environ.get("DISPLAY"):
    check_kept_downloads_entry(prefix)
else:
    check(False, "opening the kept downloads needs a display (scripts/test starts one)")
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
check(package.get(win32) == registry_path(PROGRAM_FILES_X86 + r"\LVShellExt.dll"),
      "the type library names the x86 module for win32")

listing = prefix.wine(os.path.join(tools, "lvbrowse.exe"))
check(listing.returncode == 0 and STATION in listing.stdout,
      "the folder lists the user's station through the shell from the installed DLL",
      listing.stdout + listing.stderr)
check(list(installed_products(prefix).values()) == [f'"{old_version}"'],
      f"one product is installed, version {old_version}", str(installed_products(prefix)))

# Upgrade: the newer package replaces the older one; the older one cannot come back over it.
check(prefix.msiexec("/i", msi(new_x64), "/qn") == 0,
      "msiexec /i installs the newer x64 package over the older one (exit code 0)")
products = installed_products(prefix)
check(list(products.values()) == [f'"{new_version}"'],
      f"after the upgrade one product is installed, version {new_version}", str(products))
same("the upgraded registration is the same", written(clean, prefix.registry()), package)
code = prefix.msiexec("/i", msi(old_x64), "/qn")
products = installed_products(prefix)
check(code == 1603 and list(products.values()) == [f'"{new_version}"'],
      f"the older package refuses to replace the newer one (exit code 1603, {new_version} stays)",
      f"exit code {code}, products {products}")

# Uninstall: every file, shortcut and key the package wrote goes; the user's stations stay.
check(prefix.msiexec("/x", msi(new_x64), "/qn") == 0,
      "msiexec /x removes the x64 package (exit code 0)")
left = written(clean, prefix.registry())
check(not left, "no key or value the package wrote is left", describe(left.items()))
check(not removed(clean, prefix.registry()), "nothing that was there before is gone",
      str(removed(clean, prefix.registry())[:20]))
for folder in (r"C:\Program Files\Quorvel", r"C:\Program Files (x86)\Quorvel"):
    check(not os.path.exists(prefix.unix(folder)), f"{folder} is gone")
check(not start_menu_folders(prefix),
      f"the Start-menu folder \"{START_MENU_FOLDER}\" and its shortcuts are gone")
kept = glob.glob(os.path.join(prefix.unix("C:"), "users", "*", "AppData", "Local", "Quorvel",
                              "Digital Levels", "Downloads"))
check(len(kept) == 1, "the user's folder of kept downloads stays: it is the user's data")
stations = prefix.wine(os.path.join(tools, "lvstations.exe"), "list")
check(STATION in stations.stdout, "the user's station is still there", stations.stdout)
check(STATION not in prefix.wine(os.path.join(tools, "lvbrowse.exe")).stdout,
      "the shell no longer shows the folder")
check(not installed_products(prefix), "no product is left installed")

# The x86 package is for 32-bit Windows: on this 64-bit Windows it refuses to install.
code = prefix.msiexec("/i", msi(x86), "/qn")
check(code == 1603, "msiexec /i of the x86 package fails on 64-bit Windows (exit code 1603)",
      f"exit code {code}")
left = written(clean, prefix.registry())
check(not left and not installed_products(prefix) and not start_menu_folders(prefix) and
      not any(os.path.exists(prefix.unix(folder)) for folder in
              (r"C:\Program Files\Quorvel", r"C:\Program Files (x86)\Quorvel")),
      "the refused x86 package installs nothing: no file, key, shortcut or product",
      describe(left.items()))

# A copy without that refusal installs as on 32-bit Windows; here it goes to the 32-bit folder
# and registry view.
x86_anywhere = os.path.join(scratch, "x86-without-launch-condition.msi")
shutil.copy(x86, x86_anywhere)
tables = os.path.join(scratch, "tables")
os.makedirs(tables, exist_ok=True)
with open(os.path.join(tables, "LaunchCondition.idt"), "w") as file:  # an import replaces a table
    file.write("".join(subprocess.run(["msiinfo", "export", x86_anywhere, "LaunchCondition"],
                                      capture_output=True, text=True, check=True)
                       .stdout.splitlines(keepends=True)[:3]))
subprocess.run(["msibuild", x86_anywhere, "-i", "LaunchCondition.idt"], cwd=tables, check=True)
check(prefix.msiexec("/i", msi(x86_anywhere), "/qn") == 0,
      "msiexec /i installs a copy of the x86 package without its launch condition (exit code 0)")
package32 = written(clean, prefix.registry())
installed = [name for name in BINARIES + [r"de-DE\ShellExt.txt", "User guide.html"]
             if os.path.isfile(prefix.unix(PROGRAM_FILES_X86 + "\\" + name))]
check(len(installed) == 6, f"{PROGRAM_FILES_X86} holds the x86 extension, tools and guides",
      str(installed))
same("the x86 package's registration in the 32-bit view equals regsvr32's for the x86 path",
     view_32(package32), view_32(to_32_bit_view(registered)))
check_shortcuts(prefix, PROGRAM_FILES_X86)
check(prefix.msiexec("/x", msi(x86_anywhere), "/qn") == 0,
      "msiexec /x removes the x86 package (exit code 0)")
left = written(clean, prefix.registry())
check(not left and not os.path.exists(prefix.unix(r"C:\Program Files (x86)\Quorvel")) and
      not start_menu_folders(prefix), "the x86 package leaves nothing behind",
      describe(left.items()))

# Another folder: INSTALLDIR on the command line, with a verbose log.
code = prefix.msiexec("/i", msi(old_x64), "/qn", "INSTALLDIR=" + OTHER_FOLDER + "\\",
                      "/l*v", r"C:\lv-install.log")
check(code == 0, f"msiexec /i with INSTALLDIR={OTHER_FOLDER}\\ installs silently (exit code 0)",
      f"exit code {code}")
missing = [name for name in BINARIES + ["ReadMe.txt"] + list(GUIDES.values())
           if not os.path.isfile(prefix.unix(OTHER_FOLDER + "\\" + name))]
check(not missing and not os.path.exists(prefix.unix(PROGRAM_FILES)) and
      os.path.isfile(prefix.unix(PROGRAM_FILES_X86 + r"\LVShellExt.dll")),
      f"the 64-bit extension, tools and guides are in {OTHER_FOLDER}, none in {PROGRAM_FILES}; "
      f"the 32-bit extension stays in {PROGRAM_FILES_X86}", f"missing: {missing}")
entries = prefix.registry()
moved = registry_path(OTHER_FOLDER + r"\LVShellExt.dll")
check(entries.get((CLSID + r"\inprocserver32", "@")) == moved and
      entries.get((TYPELIB + r"\0\win64", "@")) == moved,
      f"the class and its type library are registered at {OTHER_FOLDER}\\LVShellExt.dll",
      str(entries.get((CLSID + r"\inprocserver32", "@"))))
listing = prefix.wine(os.path.join(tools, "lvbrowse.exe"))
check(listing.returncode == 0 and STATION in listing.stdout,
      f"the folder lists the user's station through the shell from {OTHER_FOLDER}",
      listing.stdout + listing.stderr)
check_shortcuts(prefix, OTHER_FOLDER)
check(OTHER_FOLDER + r"\LVShellExt.dll" in text_file(prefix.unix(r"C:\lv-install.log")),
      "the verbose log (/l*v) records the install, the DLL's path included")
# Windows applies the lock when it creates the folder; icacls shows it. Wine gap: Wine's installer
# does not read MsiLockPermissionsEx and its icacls is a stub that lists nothing, so under Wine the
# ACL can only be confirmed on Windows (README); should a listing appear, it must show the lock.
listing = prefix.wine("icacls", OTHER_FOLDER).stdout
if listing.strip():
    wanted = [r"BUILTIN\Administrators:(OI)(CI)(F)", r"NT AUTHORITY\SYSTEM:(OI)(CI)(F)",
              r"BUILTIN\Users:(OI)(CI)(RX)"]
    check(all(entry in listing for entry in wanted) and "(I)" not in listing,
          f"icacls shows the lock on {OTHER_FOLDER}: " + ", ".join(wanted) + ", nothing inherited",
          listing)
else:
    print(f"-- Wine gap: icacls lists no ACL for {OTHER_FOLDER} and Wine's installer does not "
          "apply MsiLockPermissionsEx; the lock on the folder is confirmed only on Windows")
# Windows takes the folder of an installed product from its components; Wine's msiexec resolves
# it from the command line again, so the uninstall is given the same folder.
code = prefix.msiexec("/x", msi(old_x64), "/qn", "INSTALLDIR=" + OTHER_FOLDER + "\\")
left = written(clean, prefix.registry())
check(code == 0 and not left and not os.path.exists(prefix.unix(OTHER_FOLDER)) and
      not start_menu_folders(prefix),
      f"msiexec /x removes it again: {OTHER_FOLDER}, its keys and shortcuts are gone",
      f"exit code {code}\n" + describe(left.items()))

# The refusal as a user sees it, with the installer's basic user interface: a message that
# names the x64 package. (Wine titles the message box "Install Failed".)
if os.environ.get("DISPLAY"):
    started = prefix.msiexec_started("/i", msi(x86), "/qb")
    pressed = prefix.run(["wine", os.path.join(tools, "lvpress.exe"), "--title", "Install Failed",
                          "--button", "OK", "--print-text", "--timeout", "60"])
    try:
        code = prefix.msiexec_code(started, timeout=120)
    except subprocess.TimeoutExpired:
        started.kill()
        code = None
    x64_name = os.path.basename(old_x64)
    check(pressed.returncode == 0 and "for 32-bit Windows" in pressed.stdout and
          f"install {x64_name} instead" in pressed.stdout and code == 1603,
          f"with /qb the x86 package says it is for 32-bit Windows and names {x64_name}; "
          "after OK msiexec ends with exit code 1603", f"{pressed.stdout}\nexit code {code}")
else:
    check(False, "the x86 package's message under /qb needs a display (scripts/test starts one)")
prefix.stop()

print(f"checks: {sum(results)} passed, {len(results) - sum(results)} failed")
sys.exit(0 if all(results) else 1)
