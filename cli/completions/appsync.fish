# Completion of appsync for fish.

# The words before the one being completed, without the program.
function __appsync_words
    set -l words (commandline -opc)
    printf '%s\n' $words[2..-1]
end

# Whether the command is $argv[1] and, if there is $argv[2], that many positional arguments were given.
function __appsync_expects
    set -l words (__appsync_words)
    test "$words[1]" = "$argv[1]"; or return
    set -q argv[2]; or return 0
    test (count (__appsync_positionals)) -eq $argv[2]
end

function __appsync_positionals
    set -l words (__appsync_words)
    set -l awaited no
    for word in $words[2..-1]
        if test $awaited = yes
            set awaited no
        else if string match -q -- '-*' $word
            contains -- $word -o --output --log --to --remove --only; and set awaited yes
        else
            echo $word
        end
    end
end

# Whether --remove or --only of a sync may take another app: they accept several.
function __appsync_names_apps
    __appsync_expects sync; and test (count (__appsync_positionals)) -ge 2
    and string match -qr -- '^--(remove|only)(=|$)' (__appsync_words)
end

# Identifiers of the apps on the device that the command line names.
function __appsync_apps
    set -l program (commandline -opc)[1]
    set -l device (__appsync_positionals)[1]
    set device (string replace -r '^~/' "$HOME/" -- $device)
    test -f "$device/device.db"; or return 0
    $program apps $device --json 2>/dev/null | string replace -rf '^ *"identifier": "([A-Za-z0-9._-]*)",?$' '$1'
end

# __appsync_paths BEFORE FUNCTION: completes the part of the word after BEFORE with FUNCTION.
function __appsync_paths
    set -l typed (commandline -ct)
    string match -q -- "$argv[1]*" $typed; or return 0
    $argv[2] (string sub -s (math (string length -- $argv[1]) + 1) -- $typed) '' | string replace -r '^' $argv[1]
end

function __appsync_files
    complete -C "'' $argv[1]"
end

function __appsync_settings
    set -l typed (commandline -ct)
    switch $typed
        case 'app-installation=*' 'app-removal=*'
            printf '%s\n' {app-installation,app-removal}={yes,no,unset}
        case 'coordination=*'
            printf '%s\n' coordination={on,off,unset}
        case 'store=*'
            echo store=unset
            __appsync_paths store= __fish_complete_directories
        case 'demote=*' 'demote-auto=*'
            __appsync_apps | string replace -r '^(.*)$' 'demote=$1\ndemote-auto=$1'
        case 'assertion=*:*'
            printf '%s\n' (string replace -r ':.*' '' -- $typed):{granted,denied,unknown,failing,unset}
        case 'licence=*:*'
            __appsync_paths (string replace -r ':.*' ':' -- $typed) __appsync_files
        case 'assertion=*' 'licence=*'
            __appsync_apps | string replace -r '^(.*)$' 'assertion=$1:\nlicence=$1:'
        case '*'
            printf '%s\n' {app-installation,app-removal,coordination,assertion,store,demote,demote-auto,licence}=
    end
end

# Files are completed only where -F is given.
complete -c appsync -f
complete -c appsync -s h -l help -d 'Print this help message and exit'
complete -c appsync -n 'test (count (commandline -opc)) -eq 1' -l version -d 'Print the name and the version and exit'

for command in \
    'init:Create an empty device' \
    "pack:Create a package from an app's folder" \
    'sync:Sync the apps on a device with a library' \
    "backup:Back up the apps on a device" \
    'restore:Restore the apps of a backup to a new device' \
    'tap:Have a running sync send an app before the others' \
    'cancel:Have a running sync skip an app' \
    'apps:List the apps on a device' \
    'report:Report the number, size and accounts of the apps on a device' \
    "screen:Draw the device's home screen" \
    'history:Show the log of installs and removals' \
    "set:Change a device's settings" \
    'clear:Remove the state of earlier syncs' \
    'plist:Convert or show a property list'
    set -l parts (string split -m 1 : $command)
    complete -c appsync -n 'test (count (commandline -opc)) -eq 1' -a $parts[1] -d $parts[2]
end

for command in init sync backup restore tap cancel apps report screen history set clear
    complete -c appsync -n "__appsync_expects $command 0" -a '(__fish_complete_directories (commandline -ct) "")'
end
for command in sync backup restore
    complete -c appsync -n "__appsync_expects $command 1" -a '(__fish_complete_directories (commandline -ct) "")'
end
complete -c appsync -n '__appsync_expects pack 0' -a '(__fish_complete_directories (commandline -ct) "")'
complete -c appsync -n '__appsync_expects plist 0' -F
complete -c appsync -n '__appsync_expects tap 1; or __appsync_expects cancel 1' -a '(__appsync_apps)'
complete -c appsync -n '__appsync_names_apps' -a '(__appsync_apps)'
complete -c appsync -n '__appsync_expects set; and not __appsync_expects set 0' -a '(__appsync_settings)'

complete -c appsync -n '__appsync_expects init' -l coordinated -d 'install through coordinators (default)'
complete -c appsync -n '__appsync_expects init' -l direct -d 'install packages in the sync itself'
complete -c appsync -n '__appsync_expects pack' -s o -l output -rF -d 'the package to write; - is standard output'
complete -c appsync -n '__appsync_expects sync' -l remove -x -a '(__appsync_apps)' -d 'remove this app from the device'
complete -c appsync -n '__appsync_expects sync' -l only -x -a '(__appsync_apps)' \
    -d 'install or update this app only, even if it was deleted before'
for command in sync restore
    complete -c appsync -n "__appsync_expects $command" -l json -d 'write JSON Lines'
    complete -c appsync -n "__appsync_expects $command" -l log -rF -d "append the sync framework's log to this file"
end
for command in apps report history
    complete -c appsync -n "__appsync_expects $command" -l json -d 'write JSON'
end
complete -c appsync -n '__appsync_expects screen' -s o -l output -rF -d 'the PNG file to write; - is standard output'
complete -c appsync -n '__appsync_expects plist' -l to -x -a 'xml binary json' \
    -d 'the format to write: xml (default), binary or json'
complete -c appsync -n '__appsync_expects plist' -s o -l output -rF -d 'write to this file instead of standard output'
