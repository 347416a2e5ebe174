# bash completion for tessaline-config
_tessaline_config()
{
    local cur prev words cword
    _init_completion || return

    local commands="get set del sections keys dump merge encrypt decrypt"
    if ((cword == 1)); then
        COMPREPLY=($(compgen -W "$commands --help --version" -- "$cur"))
        return
    fi

    case $prev in
        --format)
            COMPREPLY=($(compgen -W "ini json sh lines" -- "$cur"))
            return
            ;;
        --default | --list-sep)
            return
            ;;
    esac

    local options
    case ${words[1]} in
        get) options="--default --decrypt" ;;
        set) options="--encrypt --existing --backup --list --list-sep --verbose" ;;
        del) options="--existing --list --list-sep --verbose" ;;
        dump) options="--format" ;;
        merge) options="--existing --backup --verbose" ;;
        *) options="" ;;
    esac
    if [[ $cur == -* ]]; then
        COMPREPLY=($(compgen -W "$options" -- "$cur"))
        return
    fi

    # FILE, and OTHER of merge, are files; the rest are names and values.
    local operand=0 i
    for ((i = 2; i < cword; i++)); do
        case ${words[i]} in
            --default | --list-sep | --format) ((i++)) ;;
            -?*) ;;
            *) ((operand++)) ;;
        esac
    done
    case ${words[1]} in
        encrypt | decrypt) ;;
        merge) ((operand <= 1)) && _filedir ;;
        *) ((operand == 0)) && _filedir ;;
    esac
} &&
    complete -F _tessaline_config tessaline-config
