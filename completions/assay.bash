# Completion of assay for bash.

# Completes an option.
_assay_options() {
    COMPREPLY=($(compgen -W "-help -crashAfter= -throwAfter= -app= -stdout= -stderr= -exit= -verbose=
        -timeout= -comment= -hang=" -- "${words[cword]}"))
    [[ ${COMPREPLY-} == *= ]] && compopt -o nospace
}

_assay() {
    local cur prev words cword
    _init_completion -n = || return
    _assay_options
}

complete -F _assay assay
