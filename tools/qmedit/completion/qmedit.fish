# Completion of qmedit for fish: qmedit completion fish | source
function __qmedit_words
    set -l words (commandline -opc)
    set -l lines ($words[1] --complete $words[2..-1] (commandline -ct) 2>/dev/null)
    switch "$lines[1]"
        case :files
            __fish_complete_path (commandline -ct)
        case :folders
            __fish_complete_directories (commandline -ct)
        case '*'
            printf '%s\n' $lines
    end
end
complete -c qmedit -f -a '(__qmedit_words)'
