# Completion for bash. It reads the program's --help, so it needs no list of its own.

_qvlocalize_subcommands() {
    sed -n '/^S[Uu][Bb]/,$s/^  \([a-z-]\{1,\}\)  .*/\1/p'
}

_qvlocalize_options() {
    sed -n 's/^  *\(-[a-z], *\)\{0,1\}\(--[a-z-]*\).*/\2/p'
}

# The argument of the option $1, such as DIR, FILE or TEXT:{a,b}; nothing for a flag.
_qvlocalize_value() {
    sed -n "s/^  *$1 \([A-Z]\{1,\}\(:{[^}]*}\)\{0,1\}\)\([= ].*\)\{0,1\}$/\1/p"
}

_qvlocalize() {
    local program=$1 current=$2 previous=$3 path=() help options="" value="" word
    COMPREPLY=()
    help=$("$program" --help 2>/dev/null) || return
    for word in "${COMP_WORDS[@]:1:COMP_CWORD-1}"; do
        if _qvlocalize_subcommands <<<"$help" | grep -qxF -e "$word"; then
            path+=("$word")
            help=$("$program" "${path[@]}" --help 2>/dev/null) || return
            options+=$'\n'$help
        fi
    done
    options=${options:-$help} # the program's own options stand before a subcommand

    # "--type=w" is three words here.
    [[ $previous == = ]] && previous=${COMP_WORDS[COMP_CWORD-2]}
    [[ $current == = ]] && current=""
    [[ $previous =~ ^--[a-z-]+$ ]] && value=$(_qvlocalize_value "$previous" <<<"$options")
    case $value in
    DIR)
        compopt -o filenames 2>/dev/null
        mapfile -t COMPREPLY < <(compgen -d -- "$current")
        ;;
    FILE)
        compopt -o filenames 2>/dev/null
        mapfile -t COMPREPLY < <(compgen -f -- "$current")
        ;;
    *\{*)
        value=${value#*\{}
        value=${value%\}}
        mapfile -t COMPREPLY < <(compgen -W "${value//,/ }" -- "$current")
        ;;
    ?*) ;;
    *)
        case $current in
        -*) word=$(_qvlocalize_options <<<"$options") ;;
        *) word=$(_qvlocalize_subcommands <<<"$help") ;;
        esac
        mapfile -t COMPREPLY < <(compgen -W "$word" -- "$current" | sort -u)
        ;;
    esac
}

complete -F _qvlocalize qvlocalize
