# usage: zsh drive.zsh SCRIPTS FOLDER <LINES
#
# In FOLDER, completes each line of standard input as zsh does at its end, and prints the line and below it the words that
# zsh offers, indented. Completion needs an editor, and that a terminal: an interactive shell behind one does it.
zmodload zsh/zpty
here=${0:A:h}

# Reads what the inner shell prints up to $1 into `printed`.
expect() { zpty -r inner printed "*$1" || exit }

zpty inner "TERM=dumb zsh -f -i"
zpty -w inner "fpath=(${(q)1:A} \$fpath); cd ${(q)2}; source ${(q)here}/inner.zsh; print IT-IS-'READY'"
expect IT-IS-READY

while IFS= read -r line; do
  zpty -w -n inner "$line"$'\t'
  expect $'\x03'
  print -r -- $line
  for word in ${(f)${${printed#*$'\x02'}%%$'\x03'*}//$'\r'}; do
    [[ -z $word ]] || print -r -- "  $word"
  done
done
