#!/usr/bin/env zsh
# Types command lines of kz7admin with a Tab into bash and zsh, in a pseudo-terminal, and compares the arguments that
# the completed lines have.
#
#   tests/completions.zsh PROGRAMS      (a folder)
emulate -R zsh
setopt err_exit
zmodload zsh/zpty

programs=${1:A}
work=$(mktemp -d)
trap 'rm -rf $work' EXIT
cd $work
export KZ7_STATE_DIR=$work/state PATH=$programs:$PATH TERM=dumb HOME=$work ZDOTDIR=$work
for copy in FIRST 'SECOND=a:b copy'; do kz7InstallReg -addKZ7Copy $copy 'C:\KZ7'; done >/dev/null
kz7admin repair >/dev/null
KZ7_STATE_DIR=$work/elsewhere kz7InstallReg -addKZ7Copy OTHER 'C:\KZ7' >/dev/null
touch setup.rsp

# What is typed before the Tab, and the arguments then.
rows=(
    'reso'                                'resolve'
    'copies --fo'                         'copies|--format'
    'copies --format ts'                  'copies|--format|tsv'
    'copies F'                            'copies|FIRST'
    'check S'                             'check|SECOND=a:b copy'
    'check SECOND=a:'                     'check|SECOND=a:b copy'
    'check "SECOND=a:b '                  'check|SECOND=a:b copy'
    'commit --copy F'                     'commit|--copy|FIRST'
    'repair --copy=SECOND='               'repair|--copy=SECOND=a:b copy'
    'commit --response-file se'           'commit|--response-file|setup.rsp'
    'copies --store elsew'                'copies|--store|elsewhere'
    '--store elsewhere copies '           '--store|elsewhere|copies|OTHER'
    '--store=elsewhere copies '           '--store=elsewhere|copies|OTHER'
    'resolve 9.7.800.'                    'resolve|9.7.800.0'
    'undo 2'                              'undo|2'
    'repair orph'                         'repair|orphan-service'
    'repair aliases F'                    'repair|aliases|FIRST'
    'history tr'                          'history|trim'
    'history F'                           'history|FIRST'
    'history trim --ke'                   'history|trim|--keep'
    'apply --check -- -rem'               'apply|--check|--|-removeKZ7Copy'
    'apply --check -- -removeKZ7Copy F'   'apply|--check|--|-removeKZ7Copy|FIRST'
    'tree --sto'                          'tree|--store'
)
# In the shells that are typed into, the command only shows its arguments.
shown='kz7admin() { local IFS="|"; echo "<<$*>>"; }'
typeset -A setup=(
    bash "set +o history; bind 'set bell-style none'; source <(kz7admin completion bash); $shown"
    zsh  "autoload -U compinit; compinit -u -D; source <(kz7admin completion zsh); $shown"
)
typeset -A start=(bash 'exec bash --norc --noprofile -i' zsh 'exec zsh -f -i')
failed=0
for shell in bash zsh; do
    zpty terminal $start[$shell]
    print -r $setup[$shell] >for_$shell
    zpty -w terminal "source ./for_$shell"
    for typed expected in $rows; do
        zpty -w -n terminal "kz7admin $typed"$'\t\n'
        zpty -r terminal output '*<<*>>*'
        arguments=${${output##*<<}%%>>*}
        if [[ ${arguments%/} != $expected || $output == *"$shell: "* ]]; then
            print -r "$shell: $typed<Tab>: $arguments, expected $expected: $output"
            failed=1
        fi
    done
    zpty -d terminal
done
(( failed == 0 )) && echo 'completions: all as expected'
