quillmarch_fuzz(cues)
quillmarch_fuzz(groups)
