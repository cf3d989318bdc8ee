quillmarch_fuzz(header_text)
quillmarch_fuzz(object_store xxhash::header)
quillmarch_fuzz(edl quillmarch_interchange)
