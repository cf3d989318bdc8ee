quillmarch_fuzz(cel)
quillmarch_fuzz(levels)
