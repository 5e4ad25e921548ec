# usage: bash drive.bash SCRIPTS FOLDER <LINES
#
# In FOLDER, completes each line of standard input as bash does at its end, and prints the line and below it the words that
# bash offers, indented.
source "$1/appsync.bash"
cd "$2" || exit

compopt() { :; } # what it changes is Readline's doing

while IFS= read -r line; do
  word="${line##*[[:blank:]]}"
  piece="${word##*[=:]}" # Readline splits words there, and completes what follows
  COMP_LINE="$line"
  COMP_POINT="${#line}"
  COMPREPLY=()
  _appsync appsync "$piece" ''
  printf '%s\n' "$line"
  for reply in "${COMPREPLY[@]}"; do
    printf '  %s\n' "${word%"$piece"}$reply"
  done
done
