# Completion of orvcim(1) for fish. Commands and options are those that its own help lists.

# The words in the first column of a part of the help, with what they mean.
function __orvcim_listed --argument-names part
    orvcim $argv[2..-1] --help 2>/dev/null | awk -v part="$part:" '
        /^[A-Za-z]/ { inside = $0 == part }
        inside && /^  [^ ]/ {
            text = substr($0, 3)
            meaning = text; if (sub(/^.*   */, "", meaning) == 0) meaning = ""
            name = text; sub(/ .*/, "", name); sub(/[={].*/, "", name); sub(/^.*,/, "", name)
            print name "\t" meaning
        }'
end

function __orvcim_formats
    orvcim --help 2>/dev/null | awk '$1 == "--format" { gsub(/\([^)]*\)|,| or /, " "); for (i = 3; i <= NF; i++) print $i }'
end

# The commands that the line has so far; what stands between them are options and arguments.
function __orvcim_commands
    set --local commands
    for word in (commandline --tokenize --cut-at-cursor --current-process)[2..-1]
        if __orvcim_listed Subcommands $commands | string match --quiet --regex "^$word\t"
            set --append commands $word
        end
    end
    string join \n $commands
end

function __orvcim_words
    set --local commands (__orvcim_commands)
    if string match --quiet -- '-*' (commandline --current-token)
        __orvcim_listed Options $commands
        test -z "$commands"; or __orvcim_listed Options
    else if contains -- "$commands" names instances
        orvcim classes 2>/dev/null | awk 'NR > 1 { print $1 }'
    else
        __orvcim_listed Subcommands $commands
    end
end

complete --command orvcim --no-files --arguments '(__orvcim_words)'
for option in schema provider-path tls-cert tls-key pam-folder
    complete --command orvcim --long-option $option --require-parameter --force-files
end
for option in read-group power-group
    complete --command orvcim --long-option $option --exclusive --arguments '(__fish_complete_groups)'
end
complete --command orvcim --long-option format --exclusive --arguments '(__orvcim_formats)'
