; stage1.ls: the first stage of the demo game, linked by `make demo`.
; Each line lists one file with its option words, or is a %directive that changes the
; defaults for the lines after it. '#' and ';' start a comment anywhere on a line.
; Listed names are taken from the directory qorLink runs in (example/).

%setfilename                   ; entries carry their base name from here on

data/readme.txt nocomp id=1    # plain text, stored as is
data/logo.tim id=0x20          # image-like binary, compressed (the default)
data/hero.MB                   # carries its own header: kept, body compressed

%nosetfilename
data/music.PB                  # an archive: its entries are copied one by one
data/font.TB                   # a prebuilt entry, copied byte for byte
