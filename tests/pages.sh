#!/usr/bin/env bash
# Compares the options of each command of kz7admin with those that its manual page describes, and checks the pages.
#
#   tests/pages.sh PROGRAMS      (a folder)
set -euo pipefail
admin=$(realpath "$1")/kz7admin
cd "$(dirname "$0")/../docs/man"

options() { grep -oE -- '(^|[ ,])--?[a-z][-a-z]*' | tr -d ' ,' | sort -u; }
helped() { "$admin" "$@" --help | sed -n '/^Options:/,/^[A-Z].*:$\|^$/p' | grep '^  -' | sed -E 's/^( +[^ ]+).*/\1/' | options; }
commands() { "$admin" "$@" --help | sed -n '/^Subcommands:/,/^$/s/^  \([a-z]*\) .*/\1/p'; }
described() { sed -n -E 's/^\.It (Fl .*)$/\1/p' "$1" | sed -E 's/Fl /-/g; s/ Ar .*//; s/ ,//g' | options; }

status=0
compare() { # page, the options of its commands on standard input
    diff -u --label "the program" --label "$1" <(sort -u) <(described "$1") || status=1
}
helped | compare kz7admin.1
for command in $(commands); do
    {
        helped "$command"
        for below in $(commands "$command"); do helped "$command" "$below"; done
    } | compare "kz7admin-$command.1"
    grep -q "^\.It Xr kz7admin-$command 1$" kz7admin.1 || { echo "kz7admin.1 does not list $command" && status=1; }
done
diff <(commands | sed 's/.*/kz7admin-&.1/' | sort) <(ls kz7admin-*.1) || status=1
mandoc -T lint -- * || status=1
exit $status
