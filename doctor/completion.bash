# Completion of tavosso-doctor's command line for bash.

_tavosso_doctor() {
    local word=${COMP_WORDS[COMP_CWORD]} before=${COMP_WORDS[COMP_CWORD - 1]} command='' i choices
    for ((i = 1; i < COMP_CWORD; ++i)); do
        case ${COMP_WORDS[i]} in
        token | login | explain) command=${COMP_WORDS[i]} ;;
        esac
    done
    case $before in
    --user)
        mapfile -t COMPREPLY < <(compgen -u -- "$word")
        return
        ;;
    --profile)
        mapfile -t COMPREPLY < <(compgen -W 'azure websphere' -- "$word")
        return
        ;;
    --timeout | --domain | --return-program | --redirect-uri) return ;;
    esac
    choices='--help --version --json --verbose --quiet --timeout --user --profile --domain --return-program'
    case $command in
    '') choices+=' token login explain' ;;
    token) choices+=' --fetch' ;;
    login) choices+=' --redirect-uri' ;;
    explain) choices+=' --list --markdown' ;;
    esac
    mapfile -t COMPREPLY < <(compgen -W "$choices" -- "$word")
    if [ "$command" = token ] && [[ $word != -* ]]; then
        compopt -o filenames
        mapfile -t COMPREPLY < <(compgen -f -- "$word")
    fi
}

complete -F _tavosso_doctor tavosso-doctor
