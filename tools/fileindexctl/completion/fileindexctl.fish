# fish completion for fileindexctl. The program itself knows what may follow.

function __fileindexctl_words
    set -l before (commandline -opc)
    set -e before[1]
    set -l current "$(string unescape -- (commandline -ct))"
    set -l option "$(string match -r -- '^--[^=]*=' $current)"
    if test -n "$option"
        set -a before (string trim -r -c = -- $option)
        set current "$(string replace -- $option '' $current)"
    end
    for line in (fileindexctl offer --line $before $current 2>/dev/null)
        switch $line
            case \tfiles
                printf '%s\n' $option(__fish_complete_path $current)
            case \t\*
            case '*'
                printf '%s\n' $option$line
        end
    end
end

complete -c fileindexctl -f -a '(__fileindexctl_words)'
