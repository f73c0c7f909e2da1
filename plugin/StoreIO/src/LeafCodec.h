#pragma once

#include <ZEK/TypedValue.h>

#include <rapidjson/document.h>

#include <string>

namespace StoreIO
{

/// The value that a leaf of a document has by its schema; without bytes when a text cannot be read. Numbers and Bool
/// take what the JSON value holds: 0 or false where it is of another kind.
ZEK::VTypedValue DecodeLeaf( const ZEK::IO::ISchema* i_pSchema, const rapidjson::Value& i_rLeaf );

/// What `DecodeLeaf` would pass over in silence, as a text that goes on after the leaf's name: "is not a number"; null
/// when nothing.
const char* LeafRemark( ZEK::IO::EType i_Type, const rapidjson::Value& i_rLeaf );

/// Tells a document being filled the leaf of a value. False, with nothing told, for bytes that are not of the schema,
/// and for a container that holds a number that is not finite. `io_rText` is memory to work in.
bool EncodeLeaf( const ZEK::VTypedValue& i_rValue, rapidjson::Document& io_rDocument, std::string& io_rText );

} // namespace StoreIO
