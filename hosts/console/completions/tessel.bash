# Completion of tessel for bash.

_tessel() {
    local current=${COMP_WORDS[COMP_CWORD]}
    local previous=${COMP_WORDS[COMP_CWORD - 1]}
    local commands='pack list get find number info verify diff export'
    COMPREPLY=()
    if ((COMP_CWORD == 1)); then
        mapfile -t COMPREPLY < <(
            compgen -W "$commands --help --version" -- "$current")
        return
    fi

    case ${COMP_WORDS[1]} in
    pack) local flags='-o -0 --skip-empty --walk --folders --append -f --level -j -q --help' ;;
    list) local flags='-0 --numbers --folder --salvage -q --help' ;;
    get) local flags='-0 --random --seed -q --help' ;;
    find) local flags='--glob --regex -i --folder --count --numbers -0 -j -q --help' ;;
    number) local flags='-0 -q --help' ;;
    info) local flags='--json --plot -q --help' ;;
    verify) local flags='-j -q --help' ;;
    diff) local flags='-0 -q --help' ;;
    export) local flags='-o -f -q --help' ;;
    *) return ;;
    esac

    case $previous in
    --level)
        mapfile -t COMPREPLY < <(compgen -W 'fast normal best' -- "$current")
        return
        ;;
    --walk)
        compopt -o filenames
        mapfile -t COMPREPLY < <(compgen -d -- "$current")
        return
        ;;
    -j | --random | --seed | --folder) return ;;
    esac

    if [[ $current == -* ]]; then
        mapfile -t COMPREPLY < <(compgen -W "$flags" -- "$current")
    else
        compopt -o filenames
        mapfile -t COMPREPLY < <(compgen -f -- "$current")
    fi
}
complete -F _tessel tessel
