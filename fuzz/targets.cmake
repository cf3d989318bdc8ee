quillmarch_fuzz(edl quillmarch_interchange)
quillmarch_fuzz(cues)
quillmarch_fuzz(groups)
