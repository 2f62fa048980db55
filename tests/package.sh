#!/usr/bin/env bash
# Builds a package of somebody who installs with our custom actions, and has the installer of Windows (Wine) fail in it,
# install it and remove it. Each time its exit code, the files and keys that are there afterwards and every line that
# the actions wrote to its log, in order, must be what is told here.
#
#   tests/package.sh WINDOWS_PROGRAMS      (a folder)
set -euo pipefail

[ $# -eq 1 ] || { echo "usage: package.sh WINDOWS_PROGRAMS" >&2; exit 2; }
if [ -z "${KZ7_WINE_PREFIX:-}" ]; then
    exec "$(dirname "$0")/with_wine" "$0" "$@"
fi
programs=$(realpath "$1")
source=$(realpath "$(dirname "$0")")/package/package.wxs
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
cd "$folder"

windows_path() { printf 'Z:%s' "${1//\//\\}"; }
long() { printf '%*s' "$1" '' | tr ' ' n; }

# wixl finds files by relative paths only, and has one type for all that does not run at once.
retype() {
    local type=$1 action
    shift
    for action in "$@"; do
        msibuild package.msi -q "UPDATE CustomAction SET Type=$type WHERE Action='$action'"
    done
}
cp "$programs/kz7actions64.dll" "$programs/kz7_probe.dll" .
echo installed >file.txt
wixl -a x64 -D FILE=file.txt -D ACTIONS=kz7actions64.dll -D PROBE=kz7_probe.dll -o package.msi "$source"
retype 1 Save ProbeChange FailEarly DeleteAt{Cancel,Failure}   # at once
for exit in Cancel,-2 Failure,-3; do
    msibuild package.msi -q "UPDATE InstallExecuteSequence SET Sequence=${exit#*,} WHERE Action='DeleteAt${exit%,*}'"
done
retype 51 SetDebugProp SetRollbackDeletes TellImmediate TellProbe{RolledBack,Rollback,Deferred,Commit,Committed}
retype 3073 ProbeDeferred Fail                              # deferred
retype 3329 ProbeRollback DeleteAtRollback ProbeRolledBack  # in a rollback
retype 3585 ProbeCommit DeleteAtCommit ProbeCommitted       # at the end

# What a run of the installer comes to. The user's number is Wine's affair.
run() {
    : >log
    wine "$programs/full_exit_code.exe" msiexec /qn "$@" '/l*v' "$(windows_path "$folder/log")" \
        ACTIONS_PATH="$(windows_path "$programs/kz7actions64.dll")" KZ7_COPY_NAME=COPY1 \
        MIGRATION_FILES_PATH="$(long 1023)" INI_FILES_PATH="$(long 1024)" 2>/dev/null |
        tr -d '\r' | grep '^exit code' || echo 'no exit code'
    echo 'installed:'
    (cd "$WINEPREFIX/drive_c/Program Files" && find . -path '*/KZ7 package*' -type f | sort)
    echo 'keys:'
    local root
    for root in HKEY_CURRENT_USER $(wine reg query HKEY_USERS | tr -d '\r' | grep '^HKEY_'); do
        wine reg query "$root\\SOFTWARE\\NVQ" /s 2>/dev/null || true
    done | tr -d '\r' | sed '/^$/d; /^reg: /d; s/S-1-5[-0-9]*/USER/'
    echo 'log:'
    tr -d '\r' <log | sed -n -E 's/^1: ((probe|Note|WARNING|ERROR).*[^ ]) *$/\1/p'
}

# The lines of the log that are expected of an action of a kind. A saved value's size counts its terminator, that of a
# value which the installer gave does not. Wine keeps no property from deferred actions: what was not saved is there
# as it was last set.
note() { printf 'Note: %s: %s, status %u\n' "$@"; }
probe() { printf "probe %s: $2\n" "$1" "${@:3}"; }
given() { # kind of action, name, value, whether its terminator counts
    note iMsiGetProperty "$2" 0
    probe "$1" "%s: status 0, size %u, '%s'" "$2" $((${#3} + ${4:-0})) "$3"
}
saved() { given "$@" 1; }

changed=(DEBUG_PROP TABLE_PUBLIC TablePrivate KZ7_COPY_NAME MIGRATION_FILES_PATH INI_FILES_PATH NOT_INSTALL_DOTNET
    NotSaved BASE_CLIENT_BIN_SELECTED)
before=('of the immediate phase' 'of the table' '100% of the table' COPY1 "$(long 1023)" "$(long 1024)" '' '')

named_files() {
    note iMsiGetProperty KZ7_MESSAGES 0
    note iMsiGetProperty RSP_FILE_PATH 0
}

immediate_actions() { # the feature BASE_CLIENT.bin selected: Y or N
    note iMsiGetProperty UserSID 0
    note iMsiGetProperty PROD 0
    note iMsiSetProperty BASE_CLIENT_BIN_SELECTED 0
    note iMsiGetProperty INI_FILES_PATH 234 # too long to be saved
    probe immediate 'substituted: InstalledCopies\\COPY1'
    probe immediate 'substituted without a buffer: InstalledCopies\\COPY2'
    local i name values=("${before[@]}" "$1")
    for i in "${!changed[@]}"; do
        given immediate "${changed[i]}" "${values[i]}"
    done
    for name in "${changed[@]}"; do
        note iMsiSetProperty "$name" 0
        probe immediate 'setting %s: status 0' "$name"
    done
    for name in "${changed[@]}"; do
        given immediate "$name" new
    done
}

deferred_actions() { # kind of action, the feature selected; as saved: REMOVE, state of features, a response
    probe "$1" 'opening the key: status 0'
    local i values=("${before[@]}" "$2")
    for i in "${!changed[@]}"; do
        case ${changed[i]} in
            INI_FILES_PATH | NotSaved) given "$1" "${changed[i]}" new ;;
            *) saved "$1" "${changed[i]}" "${values[i]}" ;;
        esac
    done
    saved "$1" REMOVE "$3"
    saved "$1" BASE_CLIENT.bin_SELECT_STATE "$4"
    saved "$1" ODBC_SUPPORT_SELECT_STATE "$4"
    given "$1" LDAP.bin_SELECT_STATE ''
    saved "$1" PROP_RSP_KZ7.PASSWORD "$5"
    given "$1" PROP_RSP_EMPTY ''
    saved "$1" PROP_RSP_PROD ''
}

delete() {
    note iMsiGetProperty KZ7_MESSAGES 0
    note iMsiGetProperty UserSID 0
}

deleted() { # kind of action
    delete
    probe "$1" 'opening the key: status 2'
    given "$1" DEBUG_PROP new
}

committed() {
    probe commit 'opening the key: status 0'
    saved commit DEBUG_PROP 'of the immediate phase'
    deleted commit
}

outcome() { # exit code, files
    printf 'exit code %u\ninstalled:\n' "$1"
    shift
    [ $# -eq 0 ] || printf './KZ7 package of the tests/%s\n' "$@"
    echo 'keys:'
    printf '%s\\SOFTWARE\\NVQ\\KZ7%s\n' HKEY_CURRENT_USER '' HKEY_CURRENT_USER '\TEMP' \
        'HKEY_USERS\USER' '' 'HKEY_USERS\USER' '\TEMP'
    echo 'log:'
}

same() { # why, what msiexec is told; what is expected stands in a file
    run "${@:2}" >seen
    diff -u --label expected --label seen expected seen || { echo "FAILED: $1: msiexec ${*:2}"; exit 1; }
}

printf '%s\r\n' '* of a user' 'PROD = PROD_ESE' 'KZ7.PASSWORD = "two  words "' 'EMPTY =' >responses
printf '%s\r\n' 'LEVEL = 8' 'no keyword' >bad_responses
good=RSP_FILE_PATH=$(windows_path "$folder/responses")
bad=RSP_FILE_PATH=$(windows_path "$folder/bad_responses")
bad_path="RSP_FILE_PATH: ${bad#*=}"

{
    outcome 1603
    named_files
    immediate_actions Y
    deferred_actions deferred Y '' SELECTED 'two  words '
    deferred_actions rollback Y '' SELECTED 'two  words '
    deleted rollback
} >expected
same 'a deferred action fails: it is rolled back' /i package.msi "$good" FAIL=1
{
    outcome 1603
    named_files
    immediate_actions Y
    delete
} >expected
same 'an immediate action fails: there is nothing to roll back' /i package.msi "$good" FAIL=early
{
    outcome 0 client.txt odbc.txt
    named_files
    immediate_actions Y
    deferred_actions deferred Y '' SELECTED 'two  words '
    committed
} >expected
same 'an installation, after one that was rolled back' /i package.msi "$good"
{
    outcome 0
    named_files
    echo "ERROR: ureReadRspFile, step 20: error 13: $bad_path: there is no '=' in it (line 2)"
    note iMsiGetProperty KZ7_DEFAULT_LANG 0
    immediate_actions N
    deferred_actions deferred N ALL DESELECTED ''
    committed
} >expected
same 'its removal, with responses that cannot be read' /x package.msi "$bad"
echo 'package: all runs of the installer as expected'
