# shellcheck shell=bash
# Completion of tav for bash: commands, options, files, branches and tags. Sourced when somebody first types "tav" and
# presses the tabulator, from share/bash-completion/completions/tav.

# Runs tav on the repository that the line names with -C, for what it knows.
_tav_ask() {
    tav ${folder:+-C "$folder"} "$@" 2>/dev/null
}

# The texts of a member of the document on standard input. Names with other escapes than these are left out.
_tav_texts() { # MEMBER
    sed -n 's/^ *"'"$1"'" : "\(.*\)",\{0,1\}$/\1/p' | _tav_unescaped
}

_tav_unescaped() {
    sed '/\\[^"\\]/d; s/\\\(["\\]\)/\1/g'
}

# The paths in lists of `tav status --json`.
_tav_paths() { # LIST...
    local list document
    document=$(_tav_ask status --json)
    for list; do
        printf '%s\n' "$document" | sed -n '/^    "'"$list"'" : \[$/,/^    \]/p' |
            sed -n 's/^        \(    "path" : \)\{0,1\}"\(.*\)",\{0,1\}$/\2/p' | _tav_unescaped
    done
}

_tav_references() { # branch | tag
    local kind
    for kind; do
        _tav_ask "$kind" --json | _tav_texts name
    done
}

# Offers the lines of standard input that begin as the current word does.
_tav_offer() {
    local line typed=$current
    case $typed in
        [\"\']*) typed=${typed:1} ;;
        *) typed=${typed//\\/} ;;
    esac
    while IFS= read -r line; do
        [[ $line != "$typed"* ]] || COMPREPLY+=("$line")
    done
}

_tav_offer_words() {
    mapfile -t COMPREPLY < <(compgen -W "$*" -- "$current")
}

_tav_offer_files() { # as compgen: -f, files and folders; -d, folders
    compopt -o filenames
    _tav_offer < <(cd -- "${folder:-.}" 2>/dev/null && compgen "$1" -- "${current//\\/}")
}

_tav_offer_paths() { # LIST...
    compopt -o filenames
    _tav_offer < <(_tav_paths "$@")
}

_tav_options() { # COMMAND
    case $1 in
        init) printf '%s\n' --nested --server ;;
        status) printf '%s\n' --ignored -s --short --json ;;
        add | unstage) printf '%s\n' --all ;;
        commit)
            printf '%s\n' -m --message -F --file -a --all --amend --no-edit --author --all-removed \
                --without-removed
            ;;
        log) printf '%s\n' -n --count --since --until --author --all --oneline --json ;;
        preview) printf '%s\n' -o --output --json ;;
        compare) printf '%s\n' -o --output --open --json ;;
        open) printf '%s\n' --print ;;
        rm | mv) printf '%s\n' --dry-run ;;
        gc) printf '%s\n' --dry-run --drop-undo ;;
        restore) printf '%s\n' --from --to --force --dry-run ;;
        undo) printf '%s\n' --list -n --count --dry-run --force --json ;;
        revert) printf '%s\n' -m --message ;;
        stash) printf '%s\n' -m --message --json ;;
        redo) printf '%s\n' --dry-run --force --json ;;
        checkout) printf '%s\n' --force --dry-run ;;
        switch) printf '%s\n' -c --create --force --dry-run ;;
        branch) printf '%s\n' -d --delete --force --dry-run -m --move --json ;;
        tag) printf '%s\n' -d --delete --force --dry-run --json ;;
        server) printf '%s\n' --send ;;
        files) printf '%s\n' --hash --long --at --json ;;
        ignore) printf '%s\n' --add --remove --why --dry-run --json ;;
        config) printf '%s\n' --list --unset --user --repository --json ;;
        diff) printf '%s\n' --stat --text --json ;;
        projects) printf '%s\n' --forget --json ;;
        show | verify) printf '%s\n' --json ;;
    esac
    printf '%s\n' -h --help
}

# Completes the value of the option before it, and says whether there is one.
_tav_value() { # COMMAND OPTION
    case $1:$2 in
        commit:-F | commit:--file) _tav_offer_files -f ;;
        *:--color) _tav_offer_words auto always never ;;
        :-C | init:--server) _tav_offer_files -d ;;
        preview:-o | preview:--output | compare:-o | compare:--output) _tav_offer_files -f ;;
        restore:--from | files:--at) _tav_offer < <(_tav_references branch tag) ;;
        ignore:--remove) _tav_offer < <(_tav_ask ignore) ;;
        ignore:--why | restore:--to) _tav_offer_files -f ;;
        projects:--forget) _tav_offer < <(_tav_ask projects --json | _tav_texts path) ;;
        commit:-m | commit:--message | revert:-m | revert:--message | stash:-m | stash:--message) ;;
        commit:--author | log:-n | log:--count | undo:-n | undo:--count | ignore:--add) ;;
        log:--since | log:--until) _tav_offer_words today yesterday ;;
        log:--author) ;;
        *) return 1 ;;
    esac
}

_tav_argument() { # COMMAND NUMBER, which begins with 1
    case $1:$2 in
        add:*) _tav_offer_paths modified untracked ;;
        unstage:*) _tav_offer_paths staged ;;
        stash:*)
            (($2 > 1)) || _tav_offer_words push list show pop apply drop
            _tav_offer_paths modified untracked removed staged
            ;;
        diff:*)
            _tav_offer_paths modified untracked removed staged renamed
            _tav_offer < <(_tav_references branch tag)
            ;;
        restore:*)
            _tav_offer_files -f
            _tav_offer < <(_tav_paths modified removed)
            ;;
        mv:[12] | rm:* | preview:1 | compare:1) _tav_offer_files -f ;;
        init:1 | server:1 | files:1 | export:2) _tav_offer_files -d ;;
        config:1) _tav_offer < <(_tav_ask config --json | _tav_texts key) ;;
        switch:1) _tav_offer < <(_tav_references branch) ;;
        log:*)
            _tav_offer_files -f
            (($2 > 1)) || _tav_offer < <(_tav_references branch tag)
            ;;
        show:1 | cat:1 | open:1 | revert:1 | compare:[23] | checkout:1 | export:1 | branch:2 | tag:2) _tav_offer < <(_tav_references branch tag) ;;
    esac
}

_tav() {
    local commands='init status add unstage mv rm commit revert stash log show cat open diff preview compare restore checkout switch undo redo
        branch tag fetch server files ignore config projects verify gc export'
    local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]}
    local command='' folder='' number=1 word i
    COMPREPLY=()
    for ((i = 1; i < COMP_CWORD; ++i)); do
        word=${COMP_WORDS[i]}
        case $command:$word in
            :--color) ((++i)) ;;
            :-C) ((++i == COMP_CWORD)) || folder=${COMP_WORDS[i]//[\\\"\']/} ;;
            :-*) ;;
            :*) command=$word ;;
            revert:-m | revert:--message | stash:-m | stash:--message) ((++i)) ;;
            commit:-m | commit:--message | commit:-F | commit:--file | commit:--author) ((++i)) ;;
            log:-n | log:--count) ((++i)) ;;
            preview:-o | preview:--output | compare:-o | compare:--output) ((++i)) ;;
            log:--since | log:--until | log:--author) ((++i)) ;;
            ignore:--add | ignore:--remove | ignore:--why | restore:--from | restore:--to | projects:--forget | files:--at | init:--server) ((++i)) ;;
            *:-*) ;;
            *) ((++number)) ;;
        esac
    done
    [[ $folder != \~ && $folder != \~/* ]] || folder=$HOME${folder:1}
    ((COMP_CWORD > 1)) && _tav_value "$command" "$previous" && return
    if [[ -z $command && $current == -* ]]; then
        _tav_offer_words -C --color --no-pager -q --quiet --yes -h --help --version
    elif [[ -z $command ]]; then
        _tav_offer_words "$commands"
    elif [[ $current == -* ]]; then
        _tav_offer < <(_tav_options "$command")
    else
        _tav_argument "$command" "$number"
    fi
    return 0
}

complete -F _tav tav
