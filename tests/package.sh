#!/usr/bin/env bash
# Builds an installer package that uses our custom actions, and has Windows Installer (Wine) fail to install it, install
# it and remove it. Compares the exit code, the files and keys that remain and every line that the actions log.
#
#   tests/package.sh WINDOWS_PROGRAMS [CODE_PAGE]      (a folder)
set -euo pipefail

usage() { echo "usage: package.sh WINDOWS_PROGRAMS [1252|1251|932]" >&2; exit 2; }
[ $# -eq 1 ] || [ $# -eq 2 ] || usage
page=${2:-1252}
width=1 # bytes of a character
case $page in
    1252) copy=COPY1 letter=n ;;
    1251) copy=Привет letter=Ж KZ7_LOCALE=ru_RU ;;
    932) copy=表データ表 letter=表 width=2 KZ7_LOCALE=ja_JP ;; # the second byte of some is a backslash
    *) usage ;;
esac
if [ -z "${KZ7_WINE_PREFIX:-}" ]; then
    KZ7_LOCALE=${KZ7_LOCALE:-} exec "$(dirname "$0")/with_wine" "$0" "$@"
fi
programs=$(realpath "$1")
source=$(realpath "$(dirname "$0")")/package/package.wxs
example=$(realpath "$(dirname "$0")/../examples/package")
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
cd "$folder"

windows_path() { printf 'Z:%s' "${1//\//\\}"; }
long() { printf '%*s' "$1" '' | sed "s/ /$letter/g"; }

# wixl resolves relative paths only.
cp "$programs/kz7actions64.dll" "$programs/kz7_probe.dll" .
echo installed >file.txt
wixl -a x64 -I "$example" -D FILE=file.txt -D ACTIONS=kz7actions64.dll -D PROBE=kz7_probe.dll -o package.msi "$source"
"$example/fix_actions" package.msi
"$example/fix_actions" package.msi immediate ProbeChange FailEarly
"$example/fix_actions" package.msi property SetDebugProp TellImmediate TellProbe{RolledBack,Rollback,Deferred,Commit,Committed}
"$example/fix_actions" package.msi deferred ProbeDeferred Fail
"$example/fix_actions" package.msi rollback ProbeRollback ProbeRolledBack
"$example/fix_actions" package.msi commit ProbeCommit ProbeCommitted

# Prints the results of one run. The security identifier of the user varies. Consecutive notes of properties that were
# read or set are one line with their number; those of the calls with null arguments are left out.
run() {
    : >log
    wine "$programs/full_exit_code.exe" msiexec /qn "$@" '/l*v' "$(windows_path "$folder/log")" \
        ACTIONS_PATH="$(windows_path "$programs/kz7actions64.dll")" KZ7_COPY_NAME="$copy" \
        MIGRATION_FILES_PATH="$(long 1023)" INI_FILES_PATH="$(long 1024)" 2>/dev/null |
        tr -d '\r' | grep '^exit code' || echo 'no exit code'
    (cd "$WINEPREFIX/drive_c/Program Files" && find . -path '*/KZ7 package*' -type f | sort)
    local root
    for root in HKEY_CURRENT_USER $(wine reg query HKEY_USERS | tr -d '\r' | grep '^HKEY_'); do
        wine reg query "$root\\SOFTWARE\\NVQ" /s 2>/dev/null || true
    done | tr -d '\r' | sed '/^$/d; /^reg: /d; s/S-1-5[-0-9]*/USER/'
    tr -d '\r' <log | iconv -f "CP$page" -t UTF-8 | sed -n -E '/Property: (\$Cur.*)?, status/d; s/^1: ((probe|Note|WARNING|ERROR).*[^ ]) *$/\1/p' |
        sed -E "s/$letter{1024}/<1024>/; s/$letter{1023}/<1023>/"'; s/(Note: iMsi...Property): .*, status 0/\1/' |
        uniq -c | sed -E 's/^ *([0-9]+) Note: (iMsi...Property)$/\2 x \1/; s/^ *1 //'
}

check() { # why, the expected results, arguments of msiexec
    diff -u --label expected --label seen <(printf '%s\n' "$2") <(run "${@:3}") || { echo "FAILED: $1"; exit 1; }
}

printf '%s\r\n' '* of a user' 'PROD = PROD_ESE' "KZ7.PASSWORD = \"two  $letter words \"" 'EMPTY =' |
    iconv -f UTF-8 -t "CP$page" >responses
printf '%s\r\n' 'LEVEL = 8' 'no keyword' >bad_responses
good=RSP_FILE_PATH=$(windows_path "$folder/responses")
bad=RSP_FILE_PATH=$(windows_path "$folder/bad_responses")
missing=RSP_FILE_PATH=$(windows_path "$folder/no_responses")

# The expected lines. A saved value's size counts its NUL terminator. Wine keeps no property from deferred actions, so
# one that was not saved reads as it was last set.
keys='HKEY_CURRENT_USER\SOFTWARE\NVQ\KZ7
HKEY_CURRENT_USER\SOFTWARE\NVQ\KZ7\TEMP
HKEY_USERS\USER\SOFTWARE\NVQ\KZ7
HKEY_USERS\USER\SOFTWARE\NVQ\KZ7\TEMP'
length=$((${#copy} * width))
cut=$copy$copy$copy
cut=${cut:0:$((25 / width))}
# The copy's name for two sizes of the buffer. A saved value that does not fit counts as not saved.
copy_name() { # kind of action, saved or deleted
    local room notes=2 line=() terminator=0
    [ -z "${2:-}" ] || terminator=1
    for room in 10 11; do
        if [ "${2:-}" = deleted ] || { [ "${2:-}" = saved ] && [ $room -le $length ]; }; then
            line+=("3 'new'")
        elif [ $room -le $length ]; then
            echo 'Note: iMsiGetProperty: KZ7_COPY_NAME, status 234'
            notes=1
            line+=("$((length + 1)) status 234")
        else
            line+=("$((length + terminator)) '$copy'")
        fi
    done
    printf '%s\n' "iMsiGetProperty x $notes" "probe $1: KZ7_COPY_NAME ${line[0]}, KZ7_COPY_NAME ${line[1]}"
}
# Each call with its null arguments: the property read, two substitutions, the property set.
nulls() { # kind of action, the status of a missing argument
    local name='$CurrentInstallationName$'
    echo "probe $1: nulls: $2 null null 87 $2 $name null 0 $2 null null 87 87 COPY null 0" \
        "$2 null null 87 $2 $name $name 0 $2 null null 87 0 COPY COPY 0"
}
immediate() { # the feature BASE_CLIENT.bin selected: Y or N
    cat <<TEXT
iMsiSetProperty x 1
Note: iMsiGetProperty: INI_FILES_PATH, status 234
probe immediate: substituted: $cut
probe immediate: substituted without a buffer: $copy
$(copy_name immediate)
iMsiGetProperty x 9
probe immediate: DEBUG_PROP 22 'of the immediate phase', TABLE_PUBLIC 12 'of the table', TablePrivate 17 '100% of the table', \
KZ7_COPY_NAME $length '$copy', MIGRATION_FILES_PATH $((1023 * width)) '<1023>', INI_FILES_PATH $((1024 * width)) '<1024>', NOT_INSTALL_DOTNET 0 '', \
NotSaved 0 '', BASE_CLIENT_BIN_SELECTED 1 '$1'
iMsiSetProperty x 9
probe immediate: setting: 0 0 0 0 0 0 0 0 0
iMsiGetProperty x 9
probe immediate: DEBUG_PROP 3 'new', TABLE_PUBLIC 3 'new', TablePrivate 3 'new', KZ7_COPY_NAME 3 'new', \
MIGRATION_FILES_PATH 3 'new', INI_FILES_PATH 3 'new', NOT_INSTALL_DOTNET 3 'new', NotSaved 3 'new', \
BASE_CLIENT_BIN_SELECTED 3 'new'
$(nulls immediate 5021)
TEXT
}
deferred() { # kind of action, the feature selected; as saved with its size: REMOVE, state of features, a response
    cat <<TEXT
probe $1: opening the key: status 0
iMsiGetProperty x 16
probe $1: DEBUG_PROP 23 'of the immediate phase', TABLE_PUBLIC 13 'of the table', TablePrivate 18 '100% of the table', \
KZ7_COPY_NAME $((length + 1)) '$copy', MIGRATION_FILES_PATH $((1023 * width + 1)) '<1023>', INI_FILES_PATH 3 'new', NOT_INSTALL_DOTNET 1 '', \
NotSaved 3 'new', BASE_CLIENT_BIN_SELECTED 2 '$2', REMOVE $3, BASE_CLIENT.bin_SELECT_STATE $4, \
ODBC_SUPPORT_SELECT_STATE $4, LDAP.bin_SELECT_STATE 0 '', PROP_RSP_KZ7.PASSWORD $5, PROP_RSP_EMPTY 0 '', PROP_RSP_PROD 1 ''
$(copy_name "$1" saved)
$(nulls "$1" 87)
TEXT
}
deleted() { # kind of action
    printf '%s\n' 'iMsiGetProperty x 2' "probe $1: opening the key: status 2" 'iMsiGetProperty x 1' \
        "probe $1: DEBUG_PROP 3 'new'" "$(copy_name "$1" deleted)" "$(nulls "$1" 87)"
}
committed="probe commit: opening the key: status 0
iMsiGetProperty x 1
probe commit: DEBUG_PROP 23 'of the immediate phase'
$(copy_name commit saved)
$(nulls commit 87)
$(deleted commit)"
installing="iMsiGetProperty x 4
$(immediate Y)"
installed=(Y "1 ''" "9 'SELECTED'" "$((13 + width)) 'two  $letter words '")

check 'a deferred action fails, so the installation is rolled back' "exit code 1603
$keys
$installing
$(deferred deferred "${installed[@]}")
$(deferred rollback "${installed[@]}")
$(deleted rollback)" /i package.msi "$good" FAIL=1
check 'an immediate action fails, so nothing is rolled back; its response file is missing' "exit code 1603
$keys
iMsiGetProperty x 2
ERROR: ureReadRspFile, step 10: error 2: RSP_FILE_PATH: ${missing#*=}: it cannot be read
iMsiGetProperty x 3
$(immediate Y)
iMsiGetProperty x 2" /i package.msi "$missing" FAIL=early
check 'an installation after one that was rolled back' "exit code 0
./KZ7 package of the tests/client.txt
./KZ7 package of the tests/odbc.txt
$keys
$installing
$(deferred deferred "${installed[@]}")
$committed" /i package.msi "$good"
check 'its removal, with a response file that cannot be read' "exit code 0
$keys
iMsiGetProperty x 2
ERROR: ureReadRspFile, step 20: error 13: RSP_FILE_PATH: ${bad#*=}: there is no '=' in it (line 2)
iMsiGetProperty x 3
$(immediate N)
$(deferred deferred N "4 'ALL'" "11 'DESELECTED'" "1 ''")
$committed" /x package.msi "$bad"
echo 'package: all runs as expected'
