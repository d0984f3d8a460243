# Completions of tallowmere-cli for fish.

set -l commands volumes identify spec path hfs posix name append aiff census alias serve-check help
set -l no_command "not __fish_seen_subcommand_from $commands"
complete -c tallowmere-cli -n $no_command -f

complete -c tallowmere-cli -s h -l help -d 'Print help'
complete -c tallowmere-cli -n $no_command -s V -l version -d 'Print the version'
complete -c tallowmere-cli -n $no_command -l service -r -F -d "The service's program"
complete -c tallowmere-cli -n $no_command -l deadline -x -d 'Seconds that one answer may take'

complete -c tallowmere-cli -n $no_command -a volumes -d 'Number, name and mount point of every volume'
complete -c tallowmere-cli -n $no_command -a identify -d 'Record, full HFS path and the way back, as a table'
complete -c tallowmere-cli -n $no_command -a spec -d 'Record of each path'
complete -c tallowmere-cli -n $no_command -a path -d 'Path of each record'
complete -c tallowmere-cli -n $no_command -a hfs -d 'Full HFS path of each path'
complete -c tallowmere-cli -n $no_command -a posix -d 'Path of each full HFS path'
complete -c tallowmere-cli -n $no_command -a name -d 'HFS name of each path'
complete -c tallowmere-cli -n $no_command -a append -d 'Path of each HFS name in a folder'
complete -c tallowmere-cli -n $no_command -a aiff -d 'Settings that export a sound to AIFF files'
complete -c tallowmere-cli -n $no_command -a census -d 'Check that each item of a folder comes back'
complete -c tallowmere-cli -n $no_command -a alias -d 'What alias files and records say, and where they lead'
complete -c tallowmere-cli -n $no_command -a serve-check -d 'Exercise each request of the service'
complete -c tallowmere-cli -n $no_command -a help -d 'Help for a command'
complete -c tallowmere-cli -n '__fish_seen_subcommand_from help' -f -a "$commands"

set -l conversions '__fish_seen_subcommand_from spec path hfs posix name append'
set -l identify '__fish_seen_subcommand_from identify'
set -l census '__fish_seen_subcommand_from census'
set -l alias '__fish_seen_subcommand_from alias'
for condition in $conversions $alias
    complete -c tallowmere-cli -n $condition -s q -l quiet -d 'Neither a progress bar nor a summary'
    complete -c tallowmere-cli -n $condition -l null-output -d 'Results end with a NUL'
end
complete -c tallowmere-cli -n $census -s q -l quiet -d 'No progress bar'
complete -c tallowmere-cli -n $identify -s q -l quiet -d 'No summary'
for condition in $conversions $identify $alias
    complete -c tallowmere-cli -n $condition -s 0 -l null -d 'Items end with a NUL'
end
for condition in $conversions $identify
    complete -c tallowmere-cli -n $condition -l existing -d 'Fail for what is new'
end
for condition in $conversions $alias $census
    complete -c tallowmere-cli -n $condition -l no-progress -d 'No progress bar'
end
complete -c tallowmere-cli -n "__fish_seen_subcommand_from $commands; and not __fish_seen_subcommand_from help" -l json -d 'One JSON object a line'
complete -c tallowmere-cli -n '__fish_seen_subcommand_from spec' -l hex -d 'The 70 bytes as hexadecimal digits'
complete -c tallowmere-cli -n $alias -l hex -d 'The items are hexadecimal digits'
complete -c tallowmere-cli -n $alias -l target -d 'A line for each item: where it leads'
complete -c tallowmere-cli -n '__fish_seen_subcommand_from path' -l other-volumes -d 'Look on the other volumes too'
complete -c tallowmere-cli -n '__fish_seen_subcommand_from path' -l volume -r -F -d 'Volume of all records'
complete -c tallowmere-cli -n '__fish_seen_subcommand_from path posix alias' -l volumes -r -F -d 'Table of old volumes'
complete -c tallowmere-cli -n '__fish_seen_subcommand_from path' -l byte-order -x -a 'big little' -d 'Of the numbers in bytes'
complete -c tallowmere-cli -n '__fish_seen_subcommand_from path' -l packed -d 'Items are files of records'
complete -c tallowmere-cli -n '__fish_seen_subcommand_from path' -l skip -x -d 'Bytes before the first record'
complete -c tallowmere-cli -n '__fish_seen_subcommand_from path' -l stride -x -d 'Bytes from record to record'
complete -c tallowmere-cli -n '__fish_seen_subcommand_from posix alias' -l map -r -F -d 'Folder of a copied volume'
complete -c tallowmere-cli -n '__fish_seen_subcommand_from volumes aiff serve-check' -f

set -l aiff '__fish_seen_subcommand_from aiff'
complete -c tallowmere-cli -n $aiff -l rate -x -d 'In hertz'
complete -c tallowmere-cli -n $aiff -l bits -x -d 'In a sample'
complete -c tallowmere-cli -n $aiff -l channels -x -d 'Of the sound'
complete -c tallowmere-cli -n $aiff -l format -x -d 'Four-character code' \
    -a 'NONE raw\\\\\\  twos sowt in24 in32 fl32 fl64 ulaw alaw ima4 MAC3 MAC6'
complete -c tallowmere-cli -n $aiff -l output -r -F -d 'File for the settings'
