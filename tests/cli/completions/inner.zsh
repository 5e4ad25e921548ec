# The inner shell of drive.zsh: the tabulator key prints what would be offered, between the characters 2 and 3, and
# clears the line.
autoload -Uz compinit
compinit -D -u

compadd() {
  # With one of these options a call only fills arrays.
  if ! ((${@[(I)-[OAD]]})); then
    local -a offered
    builtin compadd -A offered "$@"
    print -rl -- $IPREFIX${^${(Q)offered}}
  fi
  builtin compadd "$@"
}

print-offers() {
  print -rn -- $'\x02'
  _main_complete
  compstate[insert]= compstate[list]=
  print -rn -- $'\x03'
}
zle -C print-offers complete-word print-offers

print-offers-and-clear() {
  zle print-offers
  zle kill-whole-line
}
zle -N print-offers-and-clear
bindkey '^I' print-offers-and-clear
