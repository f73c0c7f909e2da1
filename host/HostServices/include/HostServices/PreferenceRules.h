#pragma once

#include <ZEK/Store.h>

#include <QtCore/QString>

namespace HostServices
{

/// How this host uses the fields of a preference that a store only carries: the presentation text is the label, the
/// optional text says more in a sentence or two, the first extra text is the unit behind a number, and the second is
/// `FolderKind` where a text is a folder. The first extra number is the place among its siblings, from 1 on; the
/// second is the step of a number, 0 for 1.
inline constexpr const char* FolderKind = "Folder";

/// The value that a person sets: the proposed one where values are verified, else the verified one.
const ZEK::VTypedValue& EditedValue( const ZEK::IStoreReader& i_rReader, ZEK::IStoreReader::Entry i_pEntry );

/// Number types are those of whole and of floating numbers.
bool IsNumber( const ZEK::IO::ISchema* i_pSchema );
/// Below 0, 0 or above 0 as the first number is less than the second, equal to it, or greater; false unless both are
/// numbers of one type.
bool CompareNumbers( const ZEK::VTypedValue& i_rA, const ZEK::VTypedValue& i_rB, int& o_rOrder );
/// Adds to a number, and stops at the ends of the range; an empty end is that of the type.
void AddToNumber( ZEK::VTypedValue& io_rNumber, std::int64_t i_Amount, const ZEK::VTypedValue& i_rMinimum,
                  const ZEK::VTypedValue& i_rMaximum );

/// Why the entry does not take that value; empty when it does. A value must be of the entry's type, in its range, one
/// of its choices if it has any, and for a folder absolute and no file.
QString WhyRefused( const ZEK::IStoreReader& i_rReader, ZEK::IStoreReader::Entry i_pEntry,
                    const ZEK::VTypedValue& i_rValue );

/// The range in words, such as "from 10 to 3600 s"; empty for an entry without one.
QString RangeText( const ZEK::VTypedValue& i_rMinimum, const ZEK::VTypedValue& i_rMaximum, const QString& i_rUnit );

/// As people read it: the text of a choice, "on", a number with its unit, or the text itself.
QString ValueForPeople( const ZEK::IStoreReader& i_rReader, ZEK::IStoreReader::Entry i_pEntry,
                        const ZEK::VTypedValue& i_rValue );

} // namespace HostServices
