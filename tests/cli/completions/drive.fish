# usage: fish drive.fish SCRIPTS FOLDER <LINES
#
# In FOLDER, completes each line of standard input as fish does at its end, and prints the line and below it the words that
# fish offers, indented, without the slash behind folders.
source $argv[1]/appsync.fish
cd $argv[2]; or exit

while read --local line
    printf '%s\n' $line
    complete --do-complete $line | string replace --regex '^(.*?)/?(\t.*)?$' '  $1$2'
end
exit 0 # what was offered last does not matter
