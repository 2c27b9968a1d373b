// ovMacroExpander: the one header a host includes to expand texts or to read project description files.
//
//     #include <ovmacro/ovMacroExpander.h>
//
//     orvan::FileScopeVarFrame frame;
//     orvan::basic_xstring result;
//     orvan::OutputPieces pieces;
//     orvan::MacroExpand(nullptr, &frame, text, 0, 0, result, pieces);
//
// It brings in the text types and streams, the error type, frames, the expansion entry points with the
// import callback, the expanded output and its position mapping, the records of loaded files, the
// expression parser, the project description parser and the embedded Python controls. Headers of the
// lower layers (tokens, section scanners, literal operators) stay available one by one.
#pragma once

#include "ovmacro/expander/expansion_observer.h"
#include "ovmacro/expander/import_handler.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expr/expression_parser.h"
#include "ovmacro/foundations/files.h"
#include "ovmacro/foundations/paths.h"
#include "ovmacro/foundations/stream.h"
#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/foundations/types.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/mpfw/mpfw_frame.h"
#include "ovmacro/mpfw/mpfw_parser.h"
#include "ovmacro/output/expanded_output.h"
#include "ovmacro/output/output_pieces.h"
#include "ovmacro/output/source_files.h"
#include "ovmacro/python/python_bridge.h"
#include "ovmacro/vars/var_frame.h"
