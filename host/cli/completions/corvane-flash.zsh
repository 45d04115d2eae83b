#compdef corvane-flash
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
