# Completion of the sorn command for bash: source this file, or install it under share/bash-completion/completions.
_sorn() {
    local word=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]} command=${COMP_WORDS[1]:-}
    if [ "$COMP_CWORD" -eq 1 ]; then
        mapfile -t COMPREPLY < <(compgen -W 'describe convert frame unframe serve send put rm --help --help-all' -- "$word")
        return
    fi
    case $previous in
        --from | --to) mapfile -t COMPREPLY < <(compgen -W 'json binary' -- "$word"); return ;;
        --count) mapfile -t COMPREPLY < <(compgen -W 'none single multiple' -- "$word"); return ;;
        --road) mapfile -t COMPREPLY < <(compgen -W 'typed dictionary' -- "$word"); return ;;
    esac
    case $command:$word in
        describe:-*) mapfile -t COMPREPLY < <(compgen -W '--json --help --help-all' -- "$word") ;;
        describe:*) mapfile -t COMPREPLY < <(compgen -W "$("${COMP_WORDS[0]}" describe 2>/dev/null | awk '{print $3}')" -- "$word") ;;
        convert:-*)
            mapfile -t COMPREPLY < <(compgen -W '--from --to --road --schema-version --pretty --lines --output --help --help-all' -- "$word")
            ;;
        frame:-*)
            mapfile -t COMPREPLY < <(compgen -W '--rpc-id --request-type --count --schema-version --final --header --lines --help --help-all' -- "$word")
            ;;
        frame:*) mapfile -t COMPREPLY < <(compgen -W 'request requestUpdate response cancel' -f -- "$word") ;;
        unframe:-*) mapfile -t COMPREPLY < <(compgen -W '--parse-body --help --help-all' -- "$word") ;;
        serve:-*) mapfile -t COMPREPLY < <(compgen -W '--bus --db --load --trace --help --help-all' -- "$word") ;;
        send:-*) mapfile -t COMPREPLY < <(compgen -W '--bus --wait --forget --watch --trace --help --help-all' -- "$word") ;;
        put:-* | rm:-*) mapfile -t COMPREPLY < <(compgen -W '--bus --trace --help --help-all' -- "$word") ;;
        convert:* | unframe:* | serve:* | send:* | put:* | rm:*) mapfile -t COMPREPLY < <(compgen -f -- "$word") ;;
    esac
}
complete -F _sorn sorn
