# Completion of tav for fish: commands, options, files, branches and tags.

set -l commands init status add unstage mv rm commit revert stash log show cat open diff preview compare restore checkout switch undo redo \
    branch tag fetch server files ignore config projects verify gc export

# Runs tav on the repository that the line names with -C, for what it knows.
function __tav_ask
    set -l words (commandline -opc)
    set -l folder
    for i in (seq 2 (count $words))
        if test "$words[$i]" = -C; and test $i -lt (count $words)
            set folder -C (string replace -r '^~(?=$|/)' $HOME -- $words[(math $i + 1)])
        end
    end
    command tav $folder $argv 2>/dev/null
end

# Names with other escapes than these are left out. At the head of a function, string does not read its input.
function __tav_unescaped
    cat | string match -rv '\\\\[^"\\\\]' | string replace -ra '\\\\(["\\\\])' '$1'
end

# The paths in lists of `tav status --json`.
function __tav_paths
    __tav_ask status --json | while read -l line
        if string match -qr '^    "' -- $line
            set list (string replace -rf '^    "([a-z_]*)" : \[$' '$1' -- $line)
        else if contains -- "$list" $argv
            string replace -rf '^        (?:    "path" : )?"(.*)",?$' '$1' -- $line
        end
    end | __tav_unescaped
end

function __tav_references
    for kind in $argv
        __tav_ask $kind --json | string replace -rf '^ *"name" : "(.*)",?$' '$1' | __tav_unescaped
    end
end

# Whether the line has that many arguments behind its command.
function __tav_arguments
    set -l words (commandline -opc)
    set -l count 0
    for i in (seq (count $words))
        if contains -- $words[$i] $argv[2..-1]
            set count 0
        else if not string match -q -- '-*' $words[$i]
            set count (math $count + 1)
        end
    end
    test $count -eq $argv[1]
end

complete -c tav -f
complete -c tav -s h -l help -d 'Show this help and do nothing else'
complete -c tav -n "not __fish_seen_subcommand_from $commands" -l version \
    -d 'Show the version and do nothing else'
complete -c tav -n "not __fish_seen_subcommand_from $commands" -l color -x -a 'auto always never' -d 'When to use colours'
complete -c tav -n "not __fish_seen_subcommand_from $commands" -l no-pager -d 'Do not use a pager'
complete -c tav -n "not __fish_seen_subcommand_from $commands" -s q -l quiet -d 'Do not report what was done'
complete -c tav -n "not __fish_seen_subcommand_from $commands" -l yes -d 'Do not ask questions; take the default answer'
complete -c tav -n "not __fish_seen_subcommand_from $commands" -s C -x -a '(__fish_complete_directories)' \
    -d 'Work as if started in FOLDER'

function __tav_command
    complete -c tav -n "not __fish_seen_subcommand_from $argv[3..-1]" -a $argv[1] -d $argv[2]
end
__tav_command init 'Make a folder of drawings a repository, or complete one' $commands
__tav_command status 'Show what has changed and what is staged' $commands
__tav_command add 'Stage changed and new files for the next commit' $commands
__tav_command unstage 'Take files out of the next commit' $commands
__tav_command mv 'Rename a file or folder, and stage that' $commands
__tav_command rm 'Remove committed files, and stage that' $commands
__tav_command commit 'Keep what is staged, removed and renamed as a new commit' $commands
__tav_command revert 'Make a commit that does the opposite of another one' $commands
__tav_command stash 'Put unfinished work aside, and bring it back' $commands
__tav_command log 'Show the history, newest first' $commands
__tav_command show 'Show a commit and what it changed, or a file of it' $commands
__tav_command cat 'Print a file as a commit has it' $commands
__tav_command open 'Open a read-only copy of a file as a commit has it' $commands
__tav_command diff 'Show what is different from the last commit, or between commits' $commands
__tav_command preview 'Show the preview picture of a drawing' $commands
__tav_command compare 'Show two versions of a drawing as pictures, and what differs' $commands
__tav_command restore 'Bring files back as a commit has them' $commands
__tav_command checkout 'Make the working folder what it was at a commit' $commands
__tav_command switch 'Continue on another branch' $commands
__tav_command undo 'Take back the last command that changed files, what is staged, or commits' $commands
__tav_command redo "Do again what 'tav undo' has taken back" $commands
__tav_command branch 'List the branches, or make one' $commands
__tav_command tag 'List the tags, or make one' $commands
__tav_command fetch 'Get the commits, branches and tags that the server has' $commands
__tav_command server 'Show where the history is kept, or name its new place' $commands
__tav_command files 'List the files that the repository keeps' $commands
__tav_command ignore 'Show, add or remove rules for names to ignore' $commands
__tav_command config 'Show or change settings' $commands
__tav_command projects 'List the repositories that you have made' $commands
__tav_command verify 'Read every stored version and check it against its digest' $commands
__tav_command gc 'Remove what no commit needs from the storage' $commands
__tav_command export 'Write the files of a commit into a folder of their own' $commands
functions -e __tav_command

complete -c tav -n '__fish_seen_subcommand_from init' -l nested -d 'Make a repository of its own inside of another one'
complete -c tav -n '__fish_seen_subcommand_from init' -l server -x -a '(__fish_complete_directories)' -d 'Where the history is kept'
complete -c tav -n '__fish_seen_subcommand_from init' -a '(__fish_complete_directories)'
complete -c tav -n '__fish_seen_subcommand_from status' -l ignored -d 'Show the files that the ignore rules keep out, too'
complete -c tav -n '__fish_seen_subcommand_from status' -s s -l short -d 'Show two letters and the path of each file'
complete -c tav -n '__fish_seen_subcommand_from status' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from add' -l all -d 'Stage every changed and new file'
complete -c tav -n '__fish_seen_subcommand_from add' -a '(__tav_paths modified untracked)'
complete -c tav -n '__fish_seen_subcommand_from unstage' -l all -d 'Unstage all files'
complete -c tav -n '__fish_seen_subcommand_from unstage' -a '(__tav_paths staged)'
complete -c tav -n '__fish_seen_subcommand_from mv' -l dry-run -d 'Only show what would be renamed'
complete -c tav -n '__fish_seen_subcommand_from mv' -F
complete -c tav -n '__fish_seen_subcommand_from rm' -l dry-run -d 'Only show what would be removed'
complete -c tav -n '__fish_seen_subcommand_from rm' -F
complete -c tav -n '__fish_seen_subcommand_from commit' -s m -l message -x -d 'What has changed, and why'
complete -c tav -n '__fish_seen_subcommand_from commit' -s F -l file -r -F -d 'Take the message from a file'
complete -c tav -n '__fish_seen_subcommand_from commit' -s a -l all -d 'Take changed files without staging'
complete -c tav -n '__fish_seen_subcommand_from commit' -l amend -d 'Replace the last commit'
complete -c tav -n '__fish_seen_subcommand_from commit' -l no-edit -d 'Keep the message of the commit that is replaced'
complete -c tav -n '__fish_seen_subcommand_from commit' -l author -x -d 'Who made it'
complete -c tav -n '__fish_seen_subcommand_from commit' -l all-removed -d 'Remove files that are gone even when many are'
complete -c tav -n '__fish_seen_subcommand_from commit' -l without-removed -d 'Keep files that are gone in the repository'
complete -c tav -n '__fish_seen_subcommand_from revert' -s m -l message -x -d 'The message'
complete -c tav -n '__fish_seen_subcommand_from revert' -a '(__tav_references branch tag)'
complete -c tav -n '__fish_seen_subcommand_from stash' -s m -l message -x -d 'What the work is'
complete -c tav -n '__fish_seen_subcommand_from stash' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from stash; and __tav_arguments 0 stash' -a 'push list show pop apply drop'
complete -c tav -n '__fish_seen_subcommand_from stash' -a '(__tav_paths modified untracked removed staged)'
complete -c tav -n '__fish_seen_subcommand_from log' -s n -l count -x -d 'Show at most this many commits'
complete -c tav -n '__fish_seen_subcommand_from log' -l since -x -d 'Show commits made on this date or later'
complete -c tav -n '__fish_seen_subcommand_from log' -l until -x -d 'Show commits made on this date or earlier'
complete -c tav -n '__fish_seen_subcommand_from log' -l author -x -d 'Show commits of authors with this in their name'
complete -c tav -n '__fish_seen_subcommand_from log' -l all -d 'Show the history of all branches and tags'
complete -c tav -n '__fish_seen_subcommand_from log' -l oneline -d 'Show one line for each commit'
complete -c tav -n '__fish_seen_subcommand_from log' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from log' -F -a '(__tav_references branch tag)'
complete -c tav -n '__fish_seen_subcommand_from show' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from show' -a '(__tav_references branch tag)'
complete -c tav -n '__fish_seen_subcommand_from cat' -a '(__tav_references branch tag)'
complete -c tav -n '__fish_seen_subcommand_from open' -l print -d 'Print the path of the copy, and open nothing'
complete -c tav -n '__fish_seen_subcommand_from open' -a '(__tav_references branch tag)'
complete -c tav -n '__fish_seen_subcommand_from diff' -l stat -d 'Show a line for each file and the total'
complete -c tav -n '__fish_seen_subcommand_from diff' -l text -d 'Show all lines of text files'
complete -c tav -n '__fish_seen_subcommand_from diff' -a '(__tav_references branch tag)'
complete -c tav -n '__fish_seen_subcommand_from diff' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from diff' -a '(__tav_paths modified untracked removed staged renamed)'
complete -c tav -n '__fish_seen_subcommand_from preview' -s o -l output -r -F -d 'Write the picture to this PNG file'
complete -c tav -n '__fish_seen_subcommand_from preview' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from preview' -F
complete -c tav -n '__fish_seen_subcommand_from compare' -s o -l output -r -F -d 'Write the picture to this PNG file'
complete -c tav -n '__fish_seen_subcommand_from compare' -l open -d 'Open the picture with the program of your desktop'
complete -c tav -n '__fish_seen_subcommand_from compare' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from compare' -F
complete -c tav -n '__fish_seen_subcommand_from compare' -a '(__tav_references branch tag)'
complete -c tav -n '__fish_seen_subcommand_from restore' -l from -x -a '(__tav_references branch tag)' -d 'The commit to take them from'
complete -c tav -n '__fish_seen_subcommand_from restore' -l to -r -F -d 'Write one file to this path'
complete -c tav -n '__fish_seen_subcommand_from restore' -l dry-run -d 'Only show what would be written'
complete -c tav -n '__fish_seen_subcommand_from restore' -l force -d 'Overwrite uncommitted changes'
complete -c tav -n '__fish_seen_subcommand_from restore' -F -a '(__tav_paths modified removed)'
complete -c tav -n '__fish_seen_subcommand_from checkout' -l dry-run -d 'Only show what would be done'
complete -c tav -n '__fish_seen_subcommand_from checkout' -l force -d 'Overwrite files with uncommitted changes'
complete -c tav -n '__fish_seen_subcommand_from checkout' -a '(__tav_references branch tag)'
complete -c tav -n '__fish_seen_subcommand_from switch' -l dry-run -d 'Only show what would be done'
complete -c tav -n '__fish_seen_subcommand_from switch' -l force -d 'Overwrite files with uncommitted changes'
complete -c tav -n '__fish_seen_subcommand_from switch' -a '(__tav_references branch)'
complete -c tav -n '__fish_seen_subcommand_from undo' -l list -d 'List the commands that can be taken back'
complete -c tav -n '__fish_seen_subcommand_from undo' -s n -l count -x -d 'List so many at most'
complete -c tav -n '__fish_seen_subcommand_from undo' -l dry-run -d 'Show what would be taken back'
complete -c tav -n '__fish_seen_subcommand_from undo' -l force -d 'Overwrite files that have been changed since'
complete -c tav -n '__fish_seen_subcommand_from undo' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from redo' -l dry-run -d 'Show what would be done again'
complete -c tav -n '__fish_seen_subcommand_from redo' -l force -d 'Overwrite files that have been changed since'
complete -c tav -n '__fish_seen_subcommand_from redo' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from branch' -s d -l delete -d 'Delete it'
complete -c tav -n '__fish_seen_subcommand_from branch' -l force -d 'Delete it even if nothing else leads to its commits'
complete -c tav -n '__fish_seen_subcommand_from branch' -l dry-run -d 'Only show what would be deleted'
complete -c tav -n '__fish_seen_subcommand_from tag' -s d -l delete -d 'Delete it'
complete -c tav -n '__fish_seen_subcommand_from tag' -l force -d 'Delete it even if nothing else leads to its commits'
complete -c tav -n '__fish_seen_subcommand_from tag' -l dry-run -d 'Only show what would be deleted'
complete -c tav -n '__fish_seen_subcommand_from branch' -s m -l move -d 'Rename it'
complete -c tav -n '__fish_seen_subcommand_from switch' -s c -l create -d 'Create the branch'
complete -c tav -n '__fish_seen_subcommand_from branch' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from branch; and __tav_arguments 1 branch' -a '(__tav_references branch tag)'
complete -c tav -n '__fish_seen_subcommand_from tag' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from tag; and __tav_arguments 1 tag' -a '(__tav_references branch tag)'
complete -c tav -n '__fish_seen_subcommand_from server' -l send -d 'Send the commits that the server does not have'
complete -c tav -n '__fish_seen_subcommand_from server' -a '(__fish_complete_directories)'
complete -c tav -n '__fish_seen_subcommand_from files' -l hash -d 'Show the SHA-256 digest of each file'
complete -c tav -n '__fish_seen_subcommand_from files' -l long -d 'Show the last commit of each file'
complete -c tav -n '__fish_seen_subcommand_from files' -l at -x -a '(__tav_references branch tag)' -d 'List the files of a commit'
complete -c tav -n '__fish_seen_subcommand_from files' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from files' -a '(__fish_complete_directories)'
complete -c tav -n '__fish_seen_subcommand_from ignore' -l add -x -d 'A wildcard or regular expression for names'
complete -c tav -n '__fish_seen_subcommand_from ignore' -l remove -x -a '(__tav_ask ignore)' -d 'A rule to remove'
complete -c tav -n '__fish_seen_subcommand_from ignore' -l why -r -F -d 'Say which rule ignores a name'
complete -c tav -n '__fish_seen_subcommand_from ignore' -l dry-run -d 'Only show what would be done'
complete -c tav -n '__fish_seen_subcommand_from ignore' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from config' -l list -d 'List the settings in effect'
complete -c tav -n '__fish_seen_subcommand_from config' -l unset -d 'Remove a setting'
complete -c tav -n '__fish_seen_subcommand_from config' -l user -d 'For all your repositories'
complete -c tav -n '__fish_seen_subcommand_from config' -l repository -d 'For this repository only'
complete -c tav -n '__fish_seen_subcommand_from config' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from config; and __tav_arguments 0 config' -a 'color editor log.date open.program pager undo.size user.name'
complete -c tav -n '__fish_seen_subcommand_from projects' -l forget -x -a '(__fish_complete_directories)' -d 'Take one off the list'
complete -c tav -n '__fish_seen_subcommand_from projects' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from verify' -l json -d 'Print a document for programs'
complete -c tav -n '__fish_seen_subcommand_from gc' -l drop-undo -d 'Forget what could be taken back'
complete -c tav -n '__fish_seen_subcommand_from gc' -l dry-run -d 'Only show how much would be removed'
complete -c tav -n '__fish_seen_subcommand_from export; and __tav_arguments 0 export' -a '(__tav_references branch tag)'
complete -c tav -n '__fish_seen_subcommand_from export; and __tav_arguments 1 export' -a '(__fish_complete_directories)'
