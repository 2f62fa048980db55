#!/usr/bin/env bash
# Runs the same commands on the embedded store and on Windows (Wine): after each, both must have written the same
# lines, ended with the same exit code and left the same registry. The code pages 1251 and 932 get the commands that are
# about text.
#
#   tests/differential.sh LINUX_PROGRAMS WINDOWS_PROGRAMS [CODE_PAGE]      (two folders)
set -euo pipefail

usage() { echo "usage: differential.sh LINUX_PROGRAMS WINDOWS_PROGRAMS [1252|1251|932]" >&2; exit 2; }
[ $# -eq 2 ] || [ $# -eq 3 ] || usage
page=${3:-1252}
case $page in
    1252) word='Straße ×' ;;
    1251) word='Привет' KZ7_LOCALE=ru_RU ;;
    932) word='表データ表' KZ7_LOCALE=ja_JP ;; # its first and last character end in a backslash there
    *) usage ;;
esac
if [ -z "${KZ7_WINE_PREFIX:-}" ]; then
    KZ7_LOCALE=${KZ7_LOCALE:-} exec "$(dirname "$0")/with_wine" "$0" "$@"
fi
linux=$(realpath "$1")
windows=$(realpath "$2")
folder=$(mktemp -d)
finished=
trap 'status=$?; [ -n "$finished" ] || echo "FAILED: status $status of: $BASH_COMMAND" >&2; rm -rf "$folder"' EXIT
export KZ7_STATE_DIR=$folder/state
cd "$folder"

# What Wine keeps otherwise than Windows and the embedded store do.
wine_differences=(
    -e '/^"PreshutdownTimeout"=/d'                                              # a value of its own
    -e '/^"ImagePath"="/{s/"$/\\0/; s/="/=expand:/; s/\\\(["\\]\)/\1/g}'        # plain text, not expandable
)

on_linux() {
    local code=0
    printf 'KZ7LIBPATH = %s\n' "$word" >responses
    foretell "$linux/kz7admin" -- "$@"
    "$linux/$program" "$@" >output 2>error || code=$?
    compare_foretold "$linux/kz7admin"
    # Windows writes a question mark for each unit that its code page lacks.
    perl -MEncode -i -pe '$_ = encode("UTF-8", decode("cp'"$page"'", encode("cp'"$page"'", decode("UTF-8", $_),
        sub { $_[0] > 0xffff ? "??" : "?" })))' output error
    show "$code" "$("$linux/kz7admin" export 2>/dev/null | readable)"
}

# The exit code is whole here; on Linux it is the low 8 bits, or 1 where a failure has none.
on_windows() {
    printf 'KZ7LIBPATH = %s\n' "$word" | iconv -f UTF-8 -t "CP$page" >responses
    foretell wine "$windows/kz7admin.exe" -- "$@"
    wine "$windows/full_exit_code.exe" "$windows/$program.exe" "$@" >told 2>error_told
    compare_foretold wine "$windows/kz7admin.exe"
    local code
    code=$(tr -d '\r' <told | sed -n '$s/^exit code //p')
    tr -d '\r' <told | head -c "-$((${#code} + 12))" | iconv -f "CP$page" -t UTF-8 | spell >output
    tr -d '\r' <error_told | iconv -f "CP$page" -t UTF-8 >error
    local seen=$((code & 255))
    [ "$code" -eq 0 ] || [ $seen -ne 0 ] || seen=1
    show "$seen" "$(wine "$windows/kz7admin.exe" export 2>/dev/null | tr -d '\r' | readable | sed "${wine_differences[@]}")"
}

# Expandable texts as text; only what the product writes, without the keys above it.
readable() {
    perl -X -MEncode -CSD -0777 -pe '
        s/\\\n\s+//g;
        s{=hex\(2\):([0-9a-f,]*)}{"=expand:" . decode("UTF-16LE", pack "H*", $1 =~ tr/,//dr) =~ s/\0/\\0/gr}ge' |
        awk '/^\[/ { shown = /\\NVQ\\KZ7|\\Services\\KZ7|\\Application\\KZ7/ } shown'
}

show() {
    printf -- '--- exit code %s\n--- output\n' "$1"
    sed 's/; the log is .*//; s/^imported \([^ ]*\) into [^:]*/imported \1/' output
    printf -- '\n--- error\n'
    cat error
    printf -- '\n--- registry\n%s\n' "$2"
}

# What check mode foretells is what the run then changes: foretell KZ7ADMIN -- COMMAND, the run, compare_foretold KZ7ADMIN.
product_lines() { tr -d '\r' | { grep -aE '^[-+~] (service |.*\\(NVQ\\KZ7|KZ7 Management Service))' || true; } | spell; }
# Keys above the product's are spelled as Windows has them, or as the product names them.
spell() { LC_ALL=C sed 's/HKLM\\Software\\/HKLM\\SOFTWARE\\/; s/HKLM\\System\\/HKLM\\SYSTEM\\/; s/\\Eventlog\\/\\EventLog\\/'; }
foretell() {
    [ "$program" = kz7InstallReg ] || return 0
    local admin=()
    while [ "$1" != -- ]; do admin+=("$1"); shift; done
    "${admin[@]}" export >before.reg 2>before.error || true
    [ -s before.reg ] || echo 'Windows Registry Editor Version 5.00' >before.reg
    { "${admin[@]}" apply --check --diff "$@" 2>/dev/null || true; } | product_lines >foretold
}
compare_foretold() {
    [ "$program" = kz7InstallReg ] || return 0
    { "$@" diff before.reg . 2>/dev/null || true; } | product_lines >changed
    if ! diff -u foretold changed >difference; then
        echo 'FAILED: check mode foretold something else than'
        cat difference before.error
        failed=$((failed + 1))
    fi >&3
}
exec 3>&1

program=kz7InstallReg
rows=0
failed=0
same() {
    local why=$1
    shift
    rows=$((rows + 1))
    on_linux "$@" >embedded
    on_windows "$@" >wine
    if ! diff -u --label embedded --label wine embedded wine >difference; then
        printf 'FAILED: %s:' "$why"
        printf ' %q' "$@"
        printf '\n'
        cat difference
        failed=$((failed + 1))
    fi
}

finish() {
    finished=yes
    echo "differential: $rows commands, $failed differ"
    exit $((failed != 0))
}

long() { printf '%*s' "$1" '' | tr ' ' "${2:-n}"; }

# Texts of every kind in names and data: beyond the code page, beyond 16 bits, unpaired surrogates, as long as they may
# be, ending within a unit.
texts() {
    local high=$'\xed\xa0\x80' low=$'x\xed\xb2\x80' name
    printf '%s\n\n' 'Windows Registry Editor Version 5.00'
    for name in 'Привет データ表 é' '😀' "$high" "$low" "$(long 255 | sed 's/n/表/g')"; do
        printf '[HKEY_LOCAL_MACHINE\SOFTWARE\NVQ\KZ7\%s]\n"%s"="%s"\n@=hex(1):61,00,62\n' "$name" "${name:0:250}" "$name"
        printf '"high"=hex(1):00,d8,61,00,00,00\n"low"=hex(7):80,dc,61,00,00,00,00,00\n"half"=hex(7):61\n'
    done
}

other_scripts() {
    same 'a name in another script'              -addKZ7Copy 'データ' 'D:\データ表\😀'
    same 'its removal'                           -removeKZ7Copy 'データ'
    same 'it comes back, elsewhere'              -addKZ7Copy 'データ' "D:\\$(long 200 | sed 's/n/Ж/g')"
    same 'a name of 86 characters, 258 bytes'    -addKZ7Copy "$(long 86 | sed 's/n/あ/g')" 'D:\Привет мир'
    same 'a name of half the width'              -addKZ7Copy 'ﾆﾎﾝ' 'C:\KZ7\"quoted"'
    same 'a name in the code page'               -addKZ7Copy "$word" "C:\\$word"
    program=kz7admin
    same 'what is set for its instance'          commit --copy "$word" --response-file responses --instance "$word"
    same 'and for one in another script'         commit --copy 'データ' --response-file responses --instance 'ー表'
    program=kz7InstallReg
}

all_names() {
    same 'usage without an option'
    same 'usage for an unknown option'           -addKZ7
    same 'removal with nothing there'            -removeKZ7Copy COPY1
    same 'the first copy'                        -addKZ7Copy COPY1 'C:\KZ7\copy1'
    same 'the same copy, elsewhere'              -addKZ7Copy COPY1 'D:\other place'
    same 'the same copy in other letters'        -addKZ7Copy copy1 'C:\KZ7\copy1'
    same 'a second copy, option in small'        -addkz7copy COPY2 'C:\KZ7\copy2'
    same 'a location that ends in a separator'   -ADDKZ7COPY COPY3 'C:\KZ7\copy3\'
    same 'removal of one that is not there'      -removeKZ7Copy COPY4
    same 'removal of one of several'             -REMOVEKZ7COPY COPY2
    same 'it comes back'                         -addKZ7Copy COPY2 'C:\KZ7\copy2'
    same 'a name with blanks'                    -addKZ7Copy ' two  words ' 'C:\Program Files\KZ7'
    same 'a name with dots'                      -addKZ7Copy '9.7.8' 'C:\KZ7\..\dots.'
    same 'a name like a pattern'                 -addKZ7Copy '%s%n %d%%' 'C:\%PATH%\%s'
    same 'a name with wildcards'                 -addKZ7Copy '*?' '*'
    same 'a name with quotation marks'           -addKZ7Copy 'say "hi" \"' 'C:\"quoted"\'
    same 'a name that is not ASCII'              -addKZ7Copy 'Zoë ÄÖ' 'C:\Straße'
    same 'its removal'                           -removeKZ7Copy 'Zoë ÄÖ'
    other_scripts
    same 'a name with a separator'               -addKZ7Copy 'A\B' 'C:\KZ7\ab'
    same 'a name with the other separator'       -addKZ7Copy 'A/B' 'C:\KZ7\ab'
    same 'a name that begins with a separator'   -addKZ7Copy '\A' 'C:\KZ7\a'
    same 'a name that holds the token'           -addKZ7Copy 'X$CurrentInstallationName$Y' 'C:\KZ7\token'
    same 'a name that is the token'              -addKZ7Copy '$CurrentInstallationName$' 'C:\KZ7\token'
    same 'a location that holds the token'       -addKZ7Copy TOKEN 'C:\$CurrentInstallationName$'
    same 'a name of 64 characters'               -addKZ7Copy "$(long 64)" 'C:\KZ7\64'
    same 'a name of 65, alike in 64'             -addKZ7Copy "$(long 65)" 'C:\KZ7\65'
    same 'removal of one alike in 64 only'       -removeKZ7Copy "$(long 66)"
    same 'removal of it'                         -removeKZ7Copy "$(long 65)"
    same 'a name of 255 characters'              -addKZ7Copy "$(long 255 k)" 'C:\KZ7\255'
    same 'a second one alike in 64'              -addKZ7Copy "$(long 254 k)" 'C:\KZ7\254'
    same 'removal of the first'                  -removeKZ7Copy "$(long 255 k)"
    same 'a name of 256 characters'              -addKZ7Copy "$(long 256 m)" 'C:\KZ7\256'
    same 'a path over 1,024 characters'          -addKZ7Copy "$(long 1000 p)" 'C:\KZ7\1000'
    same 'a location of 300 characters'          -addKZ7Copy LONG "C:\\$(long 300)"
    same 'a program that would be cut'           -dotnet "C:\\$(long 760)"
    same 'an empty location'                     -addKZ7Copy NOWHERE ''
    same 'an empty name'                         -addKZ7Copy '' 'C:\KZ7\empty'
    same 'removal of an empty name'              -removeKZ7Copy ''
    same 'version 9 without its programs'        -V9 'C:\KZ7\v9'
    same 'a copy of version 9'                   -addv9 COPY9 'C:\KZ7\copy9'
    same 'providers of a copy'                   -DotNet 'C:\KZ7\v9\'
    same 'version 8 over copies'                 -v8 'C:\KZ7\v8'
    same 'a copy after that'                     -addKZ7Copy COPY1 'C:\KZ7\copy1'
    same 'removal of the last copy'              -removeKZ7Copy COPY1
    same 'nothing is left to remove'             -removeKZ7Copy COPY1
}

if [ "$page" -eq 1252 ]; then
    all_names
else
    other_scripts
fi

# The sample copy, which the build makes beside the programs: its library knows a level, its programs succeed.
for drive in "$KZ7_STATE_DIR/drive_c:$linux" "$WINEPREFIX/drive_c:$windows"; do
    mkdir -p "${drive%%:*}/sample"
    cp -r "${drive#*:}/../examples/copy/bin" "${drive%%:*}/sample"
done
same 'a version-8 registry'                  -v8 'C:\KZ8'
texts >texts
program=kz7admin
same 'texts of every kind'                   import texts
program=kz7InstallReg
same 'to version 9, with its programs'       -v9 'C:\sample'
same 'providers of the sample'               -dotnet 'C:\sample\'
same 'a second copy of version 9'            -addv9 'C:\sample' 'C:\sample'
same 'to version 9 once more'                -v9 'C:\sample'
same 'and back'                              -v8 'C:\KZ8'
same 'removal of all copies'                 -removeKZ7Copy kz7build

# A file in the code page with a byte that is not a character, and with the second code of one, which ends in a backslash.
if [ "$page" -eq 932 ]; then
    rows=$((rows + 1))
    printf 'REGEDIT4\n[HKEY_USERS\\KZ7]\n"bad"="\x81"\n"\x95\x5c"="\xed\x5c"\n' >narrow.reg
    wine "$windows/kz7admin.exe" import narrow.reg >/dev/null
    wine "$windows/kz7admin.exe" export 'HKU\KZ7' 2>/dev/null | tr -d '\r' | grep '^"' >seen
    printf '"bad"=hex(1):81,dc,00,00\n"表"="%s"\n' 偆 | diff - seen || failed=$((failed + 1))
fi

[ "$page" -eq 1252 ] || finish

# Wanted state and restore.
echo '{"copies": [{"name": "A", "location": "C:\\a"}, {"name": "Zoë", "location": "C:\\Straße"}]}' >copies.json
echo '{"copies": [{"name": "a", "location": "C:\\b"}, {"name": "Zoë", "state": "absent"}]}' >others.json
same 'a copy for the export'                 -addKZ7Copy FIRST 'C:\KZ7\first'
"$linux/kz7admin" export >wanted.reg 2>/dev/null
copies='HKEY_LOCAL_MACHINE\SOFTWARE\NVQ\KZ7\InstalledCopies'
printf '%s\n' REGEDIT4 "[$copies]" '"9.7"="GONE"' "[$copies\FIRST]" '"KZ7 Path Name"="D:\\b"' \
    "[-$copies\FIRST\PROFILES]" "[$copies\FIRST\CurrentVersion]" '"Release"=""' >damage.reg
program=kz7admin
same 'copies of a list'                      ensure --from copies.json
same 'nothing to do'                         ensure --from copies.json --detailed-exitcode
same 'another list, with its service'        ensure --from others.json --services --detailed-exitcode
same 'what the list leaves out'              ensure --from others.json --prune
same 'no last copy'                          ensure --from /dev/null --prune
same 'back to the export'                    restore wanted.reg --detailed-exitcode
same 'it is there'                           restore wanted.reg --detailed-exitcode
# A machine in order, one that is not, and its repair.
same 'a machine in order'                    check
same 'damage'                                import damage.reg
same 'what is not in order'                  check
same 'and what is deliberate'                check --all FIRST
same 'a prefix that names no copy'           resolve 9.7
same 'its repair, foretold'                  repair --check --diff
same 'its repair'                            repair services aliases copies --detailed-exitcode
same 'all is in order again'                 check
same 'the version of a prefix'               resolve 9 --field version
same 'a status and an error line'            explain 5021 392
program=kz7InstallReg

# Two at once, on Windows only, where no transaction keeps them apart: they leave what one after the other would have.
tool() { wine "$windows/kz7InstallReg.exe" "$@" >/dev/null 2>&1 || true; }
left() { wine "$windows/kz7admin.exe" export 2>/dev/null | tr -d '\r'; }
fresh() {
    tool -removeKZ7Copy RACE
    tool -removeKZ7Copy LAST
    {
        echo REGEDIT4
        printf '[-HKEY_LOCAL_MACHINE\\SOFTWARE\\%s]\n' 'NVQ\KZ7' 'Wow6432Node\NVQ\KZ7'
        printf '[HKEY_LOCAL_MACHINE\\SOFTWARE\\%sNVQ\\KZ7\\InstalledCopies]\n"7.7"="GONE"\n' '' 'Wow6432Node\'
    } | wine "$windows/kz7admin.exe" import - >/dev/null
    tool "${before[@]}"
}
at_once() { # why; `before`, `one` and `two` are commands; the services that they make are those of RACE and LAST
    local round
    fresh && tool "${one[@]}" && tool "${two[@]}" && left >one_first
    fresh && tool "${two[@]}" && tool "${one[@]}" && left >two_first
    for ((round = 0; round < ${KZ7_ROUNDS:-8}; round++)); do
        rows=$((rows + 1))
        fresh
        tool "${one[@]}" &
        local first=$!
        tool "${two[@]}" &
        wait $first $!
        left >both
        if ! cmp -s both one_first && ! cmp -s both two_first; then
            echo "FAILED: $1, round $round"
            diff -u one_first both || true
            failed=$((failed + 1))
        fi
    done
}
before=(-addKZ7Copy LAST 'C:\KZ7') one=(-addKZ7Copy RACE 'C:\one') two=(-addKZ7Copy RACE 'C:\two')
at_once 'two adds of one name'
two=(-removeKZ7Copy LAST)
at_once 'an add and the removal of the last copy'
before=(-addKZ7Copy LAST 'C:\KZ7') one=(-dotnet 'C:\sample') two=(-dotnet 'C:\sample')
at_once 'two registrations of providers'

# A migration that is killed at any moment is taken back by its journal.
killed_runs() {
    local round run
    fresh
    { echo REGEDIT4; for ((round = 0; round < 150; round++)); do
        printf '[HKEY_LOCAL_MACHINE\\SOFTWARE\\NVQ\\KZ7\\PROFILES\\P%d]\n"a"="b"\n"c"="%d"\n' $round $round
    done; } | wine "$windows/kz7admin.exe" import - >/dev/null
    wine "$windows/kz7admin.exe" history start >/dev/null
    left >before
    for ((round = 0; round < ${KZ7_KILLS:-10}; round++)); do
        rows=$((rows + 1))
        wine "$windows/kz7InstallReg.exe" -v9 'C:\sample' >/dev/null 2>&1 &
        sleep "0.$(printf '%03d' $((RANDOM % 500)))"
        kill -9 $! 2>/dev/null || true
        wait $! 2>/dev/null || true
        # Nothing is recorded of a run that is killed before its first change.
        run=$({ wine "$windows/kz7admin.exe" history 2>/dev/null || true; } | tr -d '\r' | awk '$4 == "kz7InstallReg" && !seen++ { print $1 }')
        left >killed
        if ! cmp -s before killed && ! wine "$windows/kz7admin.exe" undo "$run" >undone 2>&1; then
            cat undone
        fi
        left >both
        if ! diff before both >difference; then
            echo "FAILED: undo of a killed migration, round $round"
            head -20 difference
            failed=$((failed + 1))
            break
        fi
    done
}
killed_runs

# Numbers of runs are not used again, and two spellings of one value are one.
rows=$((rows + 1))
run=$(($(wine "$windows/kz7admin.exe" history 2>/dev/null | awk 'NR == 2 { print $1 }') + 1))
wine "$windows/kz7admin.exe" history trim --keep 0 >/dev/null
printf '%s\n' 'Windows Registry Editor Version 5.00' "[$copies]" '"é"="1"' '"É"="2"' |
    wine "$windows/kz7admin.exe" import - >/dev/null
if ! wine "$windows/kz7admin.exe" undo $run >undone 2>&1 || ! left | diff before -; then
    echo 'FAILED: the first run after a trim of all, or its undo'
    cat undone
    failed=$((failed + 1))
fi

# A log that a folder leads elsewhere.
mkdir "$WINEPREFIX/drive_c/elsewhere"
ln -s elsewhere "$WINEPREFIX/drive_c/link"
printf '' >responses
rows=$((rows + 1))
if wine "$windows/kz7admin.exe" commit --copy LAST --response-file responses --log 'C:\link\run.log' >/dev/null 2>&1 ||
    [ -e "$WINEPREFIX/drive_c/elsewhere/run.log" ]; then
    echo 'FAILED: a log behind a link to a folder was written'
    failed=$((failed + 1))
fi

finish
