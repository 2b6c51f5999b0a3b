; every kind of line
text.txt id=7
%setfilename
run.bin nocomp
words.bin
%nosetfilename
data/hero.MB
data/music.PB
data/font.TB
