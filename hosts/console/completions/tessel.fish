# Completion of tessel for fish.

function __tessel_needs_command
    test (count (commandline -opc)) -eq 1
end

function __tessel_uses
    set -l words (commandline -opc)
    test (count $words) -gt 1; and contains -- $words[2] $argv
end

complete -c tessel -n __tessel_needs_command -f -a pack -d 'Pack a list of paths into an archive'
complete -c tessel -n __tessel_needs_command -f -a list -d 'Write all paths of an archive'
complete -c tessel -n __tessel_needs_command -f -a get -d 'Write paths by number'
complete -c tessel -n __tessel_needs_command -f -a find -d 'Write the paths that contain a text'
complete -c tessel -n __tessel_needs_command -f -a number -d 'Write the numbers of paths'
complete -c tessel -n __tessel_needs_command -f -a info -d 'Tell what is in an archive'
complete -c tessel -n __tessel_needs_command -f -a verify -d 'Tell what of an archive is damaged'
complete -c tessel -n __tessel_needs_command -f -a diff -d 'Compare two archives'
complete -c tessel -n __tessel_needs_command -f -a export -d 'Write a store, which can grow'
complete -c tessel -n __tessel_needs_command -l version -d 'Write the version and exit'

complete -c tessel -l help -d 'Explain and exit'
complete -c tessel -n '__tessel_uses pack list get find number info verify diff export' -s q -d 'Show no progress'
complete -c tessel -n '__tessel_uses pack list get find number diff' -s 0 -d 'NUL ends each path'
complete -c tessel -n '__tessel_uses pack find verify' -s j -x -d 'Most cores to use'
complete -c tessel -n '__tessel_uses pack' -s o -r -d 'The archive to write'
complete -c tessel -n '__tessel_uses pack' -l skip-empty -d 'Leave out empty lines'
complete -c tessel -n '__tessel_uses pack' -l walk -x -a '(__fish_complete_directories)' -d 'Pack what is below a folder'
complete -c tessel -n '__tessel_uses pack' -l folders -d 'Pack folders, too'
complete -c tessel -n '__tessel_uses pack' -l append -d 'Add to an existing archive'
complete -c tessel -n '__tessel_uses pack export' -s f -d 'Replace an existing file'
complete -c tessel -n '__tessel_uses pack' -l level -x -a 'fast normal best' -d 'Time to spend on size'
complete -c tessel -n '__tessel_uses list find' -l numbers -d 'Write numbers, too'
complete -c tessel -n '__tessel_uses list find' -l folder -x -d 'Only below this folder'
complete -c tessel -n '__tessel_uses list' -l salvage -d 'Read a damaged archive'
complete -c tessel -n '__tessel_uses get' -l random -x -d 'Draw so many paths'
complete -c tessel -n '__tessel_uses get' -l seed -x -d 'Draw the same paths again'
complete -c tessel -n '__tessel_uses find' -l glob -d 'Texts are shell patterns'
complete -c tessel -n '__tessel_uses find' -l regex -d 'Texts are regular expressions'
complete -c tessel -n '__tessel_uses find' -s i -d 'Ignore the case of letters'
complete -c tessel -n '__tessel_uses find' -l count -d 'Write only how many match'
complete -c tessel -n '__tessel_uses info' -l json -d 'Write JSON'
complete -c tessel -n '__tessel_uses info' -l plot -r -d 'Draw a picture'
complete -c tessel -n '__tessel_uses export' -s o -r -d 'The store to write'
