#compdef qmedit
# Completion of qmedit for zsh: lies as _qmedit in a folder of $fpath, or source <(qmedit completion zsh)
_qmedit() {
    local line
    local -a lines values shown
    lines=("${(@f)$("${words[1]}" --complete "${(@Q)words[2,CURRENT]}" 2>/dev/null)}")
    case ${lines[1]} in
    :files) _files; return ;;
    :folders) _files -/; return ;;
    '') return 1 ;;
    esac
    for line in "${lines[@]}"; do
        values+=("${line%%$'\t'*}")
        shown+=("${line/$'\t'/  -- }")
    done
    compadd -M 'm:{a-zA-Z}={A-Za-z}' -l -d shown -a values
}
if [ "${funcstack[1]}" = _qmedit ]; then
    _qmedit "$@"
else
    compdef _qmedit qmedit
fi
