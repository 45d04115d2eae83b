# fish completion for corvane-flash; printed by 'corvane-flash completion fish'
function __corvane_flash_words
  set -l words (commandline -opc)
  set -l typed (commandline -ct | string trim -l -c '\'"')
  set -l tool (string replace -r '^~' $HOME -- $words[1])
  set -e words[1]
  for word in ($tool completion words -- $words "$typed" 2>/dev/null)
    if string match -q ':files*' -- $word
      set -l before (string sub -s 8 -- $word)
      for path in (__fish_complete_path (string sub -s (math 1 + (string length -- "$before")) -- "$typed"))
        echo -- $before$path
      end
    else
      echo -- $word
    end
  end
end
complete -c corvane-flash -f -a '(__corvane_flash_words)'
