# shellcheck shell=bash
# Small files of several kinds, each well formed. Sourced by demo.sh.

make_text() {
    printf '%s\n' "Things to bring:" "- sun cream" "- a book" >"$1"
}

make_pdf() {
    printf '%s\n' '%PDF-1.4' '1 0 obj<</Type/Catalog/Pages 2 0 R>>endobj' \
        '2 0 obj<</Type/Pages/Kids[3 0 R]/Count 1>>endobj' \
        '3 0 obj<</Type/Page/Parent 2 0 R/MediaBox[0 0 72 72]>>endobj' \
        'trailer<</Root 1 0 R>>' '%%EOF' >"$1"
}

# One pixel.
make_png() {
    base64 -d >"$1" <<<'iVBORw0KGgoAAAANSUhEUgAAAAEAAAABCAIAAACQd1PeAAAADElEQVR42mMwmPAfAAKzAcAUHoB7AAAAAElFTkSuQmCC'
}

# One grey pixel: quantisation and Huffman tables of the smallest kind, and two code bits of picture.
make_jpeg() {
    {
        printf '\xff\xd8\xff\xdb\x00\x43\x00'
        head -c 64 /dev/zero | tr '\0' '\1'
        printf '\xff\xc0\x00\x0b\x08\x00\x01\x00\x01\x01\x01\x11\x00'
        printf '\xff\xc4\x00\x14\x00\x01'
        head -c 16 /dev/zero
        printf '\xff\xc4\x00\x14\x10\x01'
        head -c 16 /dev/zero
        printf '\xff\xda\x00\x08\x01\x01\x00\x00\x3f\x00\x3f\xff\xd9'
    } >"$1"
}

# A tenth of a second of silence: 8000 samples a second, one byte each.
make_wav() {
    {
        printf 'RIFF\x44\x03\x00\x00WAVEfmt \x10\x00\x00\x00\x01\x00\x01\x00'
        printf '\x40\x1f\x00\x00\x40\x1f\x00\x00\x01\x00\x08\x00data\x20\x03\x00\x00'
        head -c 800 /dev/zero | tr '\0' '\200'
    } >"$1"
}

# The header of a film without pictures.
make_mp4() {
    printf '\x00\x00\x00\x18ftypisom\x00\x00\x02\x00isommp42\x00\x00\x00\x08mdat' >"$1"
}
