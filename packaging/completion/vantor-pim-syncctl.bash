# bash completion for vantor-pim-syncctl

# NOUN: what may follow it, verbs or words, without the options.
declare -gA _vantor_pim_syncctl_words=(
    [account]='add list remove show update' [calendars]=list [contact]='add delete photo set show' [contacts]=list
    [daemon]='start status stop' [doctor]='' [event]='add delete set show' [events]=list
    [export]='contacts events todos' [group]='add delete set show' [groups]=list [import]='' [init]='' [key]=set
    [log]='' [setting]='get set' [status]='' [stop]='all calendar contacts' [sync]='all calendar contacts'
    [todo]='add delete set show' [todos]=list [watch]=''
)
_vantor_pim_syncctl_account='--email --server --calendar-server --contacts-server --calendar --no-calendar --contacts
    --no-contacts --roaming --no-roaming --calendar-period --contacts-period --refresh-token-file'
# "NOUN VERB", or the noun alone: its options.
declare -gA _vantor_pim_syncctl_options=(
    ['account add']="--id $_vantor_pim_syncctl_account" ['account update']=$_vantor_pim_syncctl_account
    ['account list']=--json ['account show']=--json ['calendars list']='--account --json'
    ['contact add']=--account ['contact show']=--json ['contacts list']='--account --json' ['daemon status']=--json
    ['event add']=--calendar ['event delete']=--instance ['event set']=--instance ['event show']=--json
    ['events list']='--account --calendar --json' [export]='--account --calendar' ['group add']=--account
    ['group show']=--json ['groups list']='--account --json' [import]='--account --calendar' ['setting get']=--json
    [status]=--json [sync]=--wait ['todo add']=--calendar ['todo show']=--json
    ['todos list']='--account --calendar --json'
)

_vantor_pim_syncctl() {
    local current=${COMP_WORDS[COMP_CWORD]} noun=${COMP_WORDS[1]} verb=${COMP_WORDS[2]}
    if [ "$COMP_CWORD" -eq 1 ]; then
        mapfile -t COMPREPLY < <(compgen -W "${!_vantor_pim_syncctl_words[*]} --help --version" -- "$current")
        return
    fi
    local options="${_vantor_pim_syncctl_options[$noun $verb]-} ${_vantor_pim_syncctl_options[$noun]-} --help"
    if [[ $current == -* ]]; then
        mapfile -t COMPREPLY < <(compgen -W "$options" -- "$current")
    elif [[ $noun =~ ^(sync|stop)$ && $COMP_CWORD -eq 3 || ! $noun =~ ^(sync|stop)$ && $COMP_CWORD -eq 2 ]]; then
        mapfile -t COMPREPLY < <(compgen -W "${_vantor_pim_syncctl_words[$noun]-}" -- "$current")
    fi
}
complete -o default -F _vantor_pim_syncctl vantor-pim-syncctl
