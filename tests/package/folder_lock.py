"""The folder lock of an installer package, read back with msitools: the MsiLockPermissionsEx rows
and the security descriptor each carries, taken apart as Windows reads SDDL."""
import re
import subprocess

FULL_CONTROL = 0x1F01FF  # FILE_ALL_ACCESS
READ_AND_EXECUTE = 0x1200A9  # FILE_GENERIC_READ | FILE_GENERIC_EXECUTE, icacls's (RX)
# Rights that let their holder change a folder's files or its protection (winnt.h).
WRITE_RIGHTS = {
    "FILE_WRITE_DATA": 0x2, "FILE_APPEND_DATA": 0x4, "FILE_WRITE_EA": 0x10,
    "FILE_DELETE_CHILD": 0x40, "FILE_WRITE_ATTRIBUTES": 0x100, "DELETE": 0x10000,
    "WRITE_DAC": 0x40000, "WRITE_OWNER": 0x80000, "GENERIC_ALL": 0x10000000,
    "GENERIC_WRITE": 0x40000000,
}
# The SDDL right names of files and the generic and standard rights (ACE strings).
RIGHT_NAMES = {
    "FA": FULL_CONTROL, "FR": 0x120089, "FW": 0x120116, "FX": 0x1200A0,
    "GA": 0x10000000, "GX": 0x20000000, "GW": 0x40000000, "GR": 0x80000000,
    "SD": 0x10000, "RC": 0x20000, "WD": 0x40000, "WO": 0x80000,
}
# The accounts the lock may name, by their SDDL aliases: never by a name that Windows translates.
ADMINISTRATORS, SYSTEM, USERS = "BA", "SY", "BU"


def table(package, name):
    """The rows of one table of an MSI as dictionaries by column; none when it is missing."""
    result = subprocess.run(["msiinfo", "export", package, name], capture_output=True, text=True)
    lines = result.stdout.replace("\r", "").split("\n")
    if result.returncode != 0 or len(lines) < 3:
        return []
    columns = lines[0].split("\t")
    return [dict(zip(columns, line.split("\t"))) for line in lines[3:] if line]


def tables(package):
    return set(subprocess.run(["msiinfo", "tables", package], capture_output=True,
                              text=True).stdout.split())


def rights(text):
    """An ACE's rights: a number (0x...) or a run of two-letter names."""
    if text.lower().startswith("0x"):
        return int(text, 16)
    names = [text[i:i + 2] for i in range(0, len(text), 2)]
    if len(text) % 2 or any(name not in RIGHT_NAMES for name in names):
        raise ValueError(f"unknown rights {text!r}")
    mask = 0
    for name in names:
        mask |= RIGHT_NAMES[name]
    return mask


def parse_dacl(sddl):
    """(DACL flags, [(ACE type, ACE flags, rights, account)]) of an SDDL text with a DACL only."""
    match = re.fullmatch(r"D:([A-Z]*)((?:\([^()]*\))+)", sddl)
    if not match:
        raise ValueError(f"not a DACL in SDDL: {sddl!r}")
    aces = []
    for ace in re.findall(r"\(([^()]*)\)", match.group(2)):
        fields = ace.split(";")
        if len(fields) != 6:
            raise ValueError(f"an ACE needs six fields: {ace!r}")
        kind, flags, mask, _, _, account = fields
        aces.append((kind, flags, rights(mask), account))
    return match.group(1), aces


def sddl_problems(sddl):
    """What keeps SDDL from being the lock: protected, administrators and SYSTEM full control,
    users read and execute and nothing that writes, no one else, the same for what is inside."""
    try:
        flags, aces = parse_dacl(sddl)
    except ValueError as error:
        return [str(error)]
    problems = []
    if "P" not in flags:
        problems.append("the DACL is not protected: the folder would inherit its parent's ACEs")
    wanted = {ADMINISTRATORS: FULL_CONTROL, SYSTEM: FULL_CONTROL, USERS: READ_AND_EXECUTE}
    accounts = sorted(account for _, _, _, account in aces)
    if accounts != sorted(wanted):
        problems.append(f"the ACEs name {accounts}, not one each for {sorted(wanted)}")
    for kind, ace_flags, mask, account in aces:
        if kind != "A":
            problems.append(f"{account}: ACE type {kind}, not an allowed ACE")
        if "OI" not in ace_flags or "CI" not in ace_flags or "IO" in ace_flags:
            problems.append(f"{account}: flags {ace_flags!r} do not reach the folder, its files "
                            "and its subfolders (OI, CI, not IO)")
        if account == USERS:
            writes = [name for name, bit in WRITE_RIGHTS.items() if mask & bit]
            if writes or mask & READ_AND_EXECUTE != READ_AND_EXECUTE:
                problems.append(f"users get {mask:#x}: write rights {writes}, read and execute "
                                f"{mask & READ_AND_EXECUTE:#x} of {READ_AND_EXECUTE:#x}")
        elif account in wanted and mask != wanted[account]:
            problems.append(f"{account} gets {mask:#x}, not full control")
    return problems


def lock_problems(package, install_folders):
    """What is wrong with PACKAGE's lock: each of INSTALL_FOLDERS (Directory keys) and every folder
    that holds a file of the package locked through its CreateFolder row, by a sound SDDL."""
    problems = []
    if "LockPermissions" in tables(package):
        problems.append("the package also has a LockPermissions table (Windows Installer 5 then "
                        "refuses it with error 1941)")
    locks = table(package, "MsiLockPermissionsEx")
    locked = {row["LockObject"] for row in locks}
    created = {row["Directory_"] for row in table(package, "CreateFolder")}
    component_folder = {row["Component"]: row["Directory_"] for row in table(package, "Component")}
    with_files = {component_folder.get(row["Component_"]) for row in table(package, "File")}
    for folder in sorted(set(install_folders) | with_files):
        if folder not in locked:
            problems.append(f"{folder} is not locked")
    for row in locks:
        what = f"{row['MsiLockPermissionsEx']} ({row['LockObject']})"
        if row["Table"] != "CreateFolder" or row["LockObject"] not in created:
            problems.append(f"{what}: no CreateFolder row to apply it ({row['Table']})")
        if row.get("Condition"):
            problems.append(f"{what}: applied only when {row['Condition']}")
        problems += [f"{what}: {problem}" for problem in sddl_problems(row["SDDLText"])]
    return problems, locks
