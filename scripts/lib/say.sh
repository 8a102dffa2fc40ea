# shellcheck shell=bash
# How the repository's commands talk to the person who runs them.

if [[ -t 1 ]]; then
    say_bold=$'\e[1m'
    say_plain=$'\e[0m'
else
    say_bold=''
    say_plain=''
fi

# Announces a part of the work.
say_heading()
{
    printf '\n%s== %s%s\n' "$say_bold" "$*" "$say_plain"
}

# Tells what is being done now; on standard error, so that a command's results stay clean.
say_note()
{
    printf -- '-- %s\n' "$*" >&2
}

# Ends the command with a reason.
die()
{
    printf '%s: %s\n' "${0##*/}" "$*" >&2
    exit 1
}
