# Completion of assay-host for bash. The options of the child come from the file of assay, which is in
# the same folder.

_assay_host() {
    local cur prev words cword
    _init_completion -n = || return

    local command="" index
    for ((index = 1; index < cword; index++)); do
        case ${words[index]} in
        --)
            # The options of the child.
            words=("${words[0]}" "${words[@]:index+1}")
            cword=$((cword - index))
            declare -F _assay_options >/dev/null || source "${BASH_SOURCE[0]%/*}/assay.bash"
            _assay_options
            return
            ;;
        run | torture | diff | show | explain | check | advise | state | bugreport) [ -n "$command" ] || command=${words[index]} ;;
        esac
    done

    case $prev in
    --assay | --output | --requirements | --from | --baseline)
        _filedir
        return
        ;;
    --state)
        _filedir -d
        return
        ;;
    --format)
        local forms="text json jsonl html prometheus nfd ansible"
        [ "$command" = advise ] && forms="text env json"
        [ "$command" = diff ] && forms="text json html"
        [ "$command" = show ] && forms="text json html prometheus nfd ansible"
        COMPREPLY=($(compgen -W "$forms" -- "$cur"))
        return
        ;;
    --schema)
        COMPREPLY=($(compgen -W "1 2" -- "$cur"))
        return
        ;;
    --need)
        COMPREPLY=($(compgen -W "opengl opencl both" -- "$cur"))
        return
        ;;
    --kind)
        COMPREPLY=($(compgen -W "crash throw both" -- "$cur"))
        return
        ;;
    --timeout | --repeat | --for | --tolerance | --require | --wait | --max-age | --pause | --pause-growth | --retries | \
        --forgive | --forgive-freeze | --keep-absent | --keep-unknown | --unclear | --unclear-pause)
        return
        ;;
    esac

    local options="--help"
    case $command in
    run) options+=" --assay --timeout --format --schema --need --identify --repeat --for --raw --output --" ;;
    torture) options+=" --assay --timeout --kind --" ;;
    diff) options+=" --format --output --tolerance --identity --all" ;;
    explain) ;;
    show) options+=" --format --schema --output" ;;
    check)
        options+=" --require --requirements --from --state --max-age --baseline --tolerance --assay --timeout --"
        ;;
    advise)
        options+=" --state --assay --timeout --format --need --wait --max-age --fresh --pause"
        options+=" --pause-growth --retries --forgive --forgive-freeze --keep-absent --keep-unknown"
        options+=" --unclear --unclear-pause --dry-run"
        ;;
    state) options+=" --state" ;;
    bugreport) options+=" --assay --timeout --output --yes --" ;;
    *) options="run torture diff show explain check advise state bugreport --help --version" ;;
    esac
    if [[ $command = diff || $command = show ]] && [[ $cur != -* ]]; then
        _filedir
    elif [ "$command" = explain ] && [[ $cur != -* ]]; then
        COMPREPLY=($(compgen -W "$("${COMP_WORDS[0]}" explain 2>/dev/null | sed "s/ (.*//")" -- "$cur"))
    elif [ "$command" = state ] && [[ $cur != -* ]]; then
        COMPREPLY=($(compgen -W "list show forget set" -- "$cur"))
    else
        COMPREPLY=($(compgen -W "$options" -- "$cur"))
    fi
}

complete -F _assay_host assay-host
