#pragma once

// The host's editor object. The library only keeps pointers to it.
class BuiltinEditor;
