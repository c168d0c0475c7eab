// What is precompiled has to belong to a target with a source.
