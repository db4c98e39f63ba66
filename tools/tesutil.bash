# bash completion for tesutil: commands, their options, the values of the level options, and
# file names for the rest.

_tesutil() {
    local cur prev words cword
    _init_completion || return

    local commands="verify stamp checksum filelist roots cores-level find java version
                    abspath absdir relpath debug-demo"
    local global_options="--roots --debug --diag --help --version"

    case $prev in
        --debug)
            COMPREPLY=($(compgen -W 'off normal detailed verbose' -- "$cur"))
            return
            ;;
        --diag)
            COMPREPLY=($(compgen -W 'silent reduced standard full' -- "$cur"))
            return
            ;;
        --roots)
            _filedir -d
            return
            ;;
        --files-from)
            _filedir
            return
            ;;
    esac

    # The command is the first word that is neither an option nor the value of one.
    local i command=""
    for ((i = 1; i < cword; i++)); do
        case ${words[i]} in
            --roots | --debug | --diag) ((i++)) ;;
            -*) ;;
            *)
                command=${words[i]}
                break
                ;;
        esac
    done

    if [[ -z $command ]]; then
        if [[ $cur == -* ]]; then
            COMPREPLY=($(compgen -W "$global_options" -- "$cur"))
        else
            COMPREPLY=($(compgen -W "$commands" -- "$cur"))
        fi
        return
    fi

    local options="--help"
    case $command in
        verify) options+=" --quiet --status --strict --files-from" ;;
        stamp) options+=" --force --files-from" ;;
        checksum) options+=" --files-from" ;;
        filelist) options+=" --paths" ;;
        find) options+=" --container" ;;
        debug-demo) options+=" --debug" ;;
    esac
    if [[ $cur == -* ]]; then
        COMPREPLY=($(compgen -W "$options" -- "$cur"))
        return
    fi
    case $command in
        verify | stamp | checksum | filelist | abspath | absdir | relpath) _filedir ;;
    esac
} && complete -F _tesutil tesutil
