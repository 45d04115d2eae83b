// bash, zsh, fish.

#include "host/cli/CompletionScripts.h"

namespace host {

namespace {

constexpr CompletionScript kScripts[] = {
    {"bash", R"(# bash completion for corvane-flash; printed by 'corvane-flash completion bash'
_corvane_flash() {
  local line=${COMP_LINE:0:COMP_POINT} word help typed cut='' escape=%q
  local -a words=()
  # bash takes words apart at = and :, which stand inside of ours.
  for word in "${COMP_WORDS[@]:0:COMP_CWORD+1}"; do
    if [[ ${#words[@]} = 0 || $line == [[:blank:]]* ]]; then words+=(''); fi
    line=${line#"${line%%[![:blank:]]*}"}
    [[ $line == "$word"* ]] || word=$line
    words[-1]+=$word line=${line#"$word"}
  done
  # What it replaces is only what stands behind the last of them, or behind an open quote.
  if [[ ${words[-1]} == [\'\"]* ]]; then escape=%s
  elif [[ ${words[-1]} =~ .*[$COMP_WORDBREAKS] ]]; then cut=${BASH_REMATCH[0]}; fi
  words=("${words[@]//[\\\'\"]/}") typed=${words[-1]}
  COMPREPLY=()
  while IFS=$'\t' read -r word help; do
    if [[ $word == :files ]]; then
      compopt -o filenames
      mapfile -t COMPREPLY < <(compgen -f -- "${typed#"$help"}")
    elif [[ $word == "$typed"* ]]; then
      word=${word#"$cut"}
      [[ $word != *[![:alnum:]_,=:./+-]* ]] || printf -v word "$escape" "$word"
      COMPREPLY+=("$word")
      [[ $word != *= ]] || compopt -o nospace
    fi
  done < <("${COMP_WORDS[0]/#\~/$HOME}" completion words -- "${words[@]:1}" 2>/dev/null)
}
complete -F _corvane_flash corvane-flash
)"},
    {"zsh", R"(#compdef corvane-flash
# zsh completion for corvane-flash; printed by 'corvane-flash completion zsh'
_corvane-flash() {
  local line word help files=none
  local -a closed closed_lines open open_lines
  for line in "${(@f)$(${~words[1]} completion words -- \
      "${(@Q)words[2,CURRENT-1]}" "${(Q)PREFIX}" 2>/dev/null)}"; do
    word=${line%%$'\t'*} help=${line#*$'\t'}
    line="$word${help:+  -- $help}"
    case $word in
      '') ;;
      :files) files=$help ;;
      *=) open+=("$word") open_lines+=("$line") ;;
      *) closed+=("$word") closed_lines+=("$line") ;;
    esac
  done
  compadd -l -d closed_lines -a closed
  compadd -S '' -l -d open_lines -a open
  if [[ $files != none ]]; then
    compset -P "${(b)files}"
    _files
  fi
  (( compstate[nmatches] ))
}
if [[ $funcstack[1] = _corvane-flash ]]; then _corvane-flash "$@"
else compdef _corvane-flash corvane-flash; fi
)"},
    {"fish", R"(# fish completion for corvane-flash; printed by 'corvane-flash completion fish'
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
)"},
};

}  // namespace

std::span<const CompletionScript> CompletionScripts() {
    return kScripts;
}

}  // namespace host
