# bash completion for corvane-flash; printed by 'corvane-flash completion bash'
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
