# Completion of qmedit for bash: source <(qmedit completion bash)
_qmedit() {
    local word line words=() current=${COMP_WORDS[COMP_CWORD]}
    COMPREPLY=()
    for word in "${COMP_WORDS[@]:1:COMP_CWORD}"; do
        word=${word/#\~/$HOME}
        word=${word//[\\\"\']/}
        words+=("$word")
    done
    while IFS= read -r line; do
        case $line in
        :files) mapfile -t COMPREPLY < <(compgen -f -- "$current"); compopt -o filenames 2>/dev/null ;;
        :folders) mapfile -t COMPREPLY < <(compgen -d -- "$current"); compopt -o filenames 2>/dev/null ;;
        *) COMPREPLY+=("$(printf '%q' "${line%%$'\t'*}")") ;;
        esac
    done < <("${COMP_WORDS[0]}" --complete "${words[@]}" 2>/dev/null)
}
complete -F _qmedit qmedit
