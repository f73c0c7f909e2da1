#pragma once

#include <ZEK/BitFlags.h>

#include <cstdint>

namespace ZEK
{

/// The flag word of an entry. Bits 0 to 9 belong to it; those without a name are carried and compared only.
enum EStoreFlags : std::uint32_t
{
  EPersistent = 1,      ///< kept when a store is saved or copied
  EVerifyRequired = 16, ///< `SetValue` proposes; another party verifies
  EReadout = 64,        ///< the program reports it, nobody sets it; excludes EVerifyRequired
  EUsingDefault = 512,  ///< the value was copied from the default
  EAllStoreFlags = 0x3ff
};

/// What changed about an entry: one bit layout for pending records and for the word that callbacks get.
///
/// Bits 0 to 9 say that the flag of `EStoreFlags` of the same number changed. The bits of an entry's children
/// reach its own word unchanged, save for Added and Removed, which turn into the child and descendant forms: the
/// word and the stamps of an entry that has children cover its subtree. Therefore `EVerificationNeeded` can be
/// told again for an entry that waits, when only a value below it changed.
enum EChangeFlags : std::uint64_t
{
  EChangeVerified = 1ull << 16,
  EChangeProposed = 1ull << 17,
  EChangeDefault = 1ull << 18,
  EChangeMinimum = 1ull << 24,
  EChangeMaximum = 1ull << 25,
  EChangeChoices = 1ull << 26,
  EChangeChoiceTexts = 1ull << 27,
  EChangeChoiceToolTips = 1ull << 28,
  EChangePresentationText = 1ull << 29,
  EChangeOptionalText = 1ull << 32,
  EChangeExtraText1 = 1ull << 33,
  EChangeExtraText2 = 1ull << 34,
  EChangeExtraText3 = 1ull << 35,
  EChangeExtraNumber1 = 1ull << 36,
  EChangeExtraNumber2 = 1ull << 37,
  EChangeAttributes = 1ull << 38,
  EChangeHasChoices = 1ull << 39, ///< the choices went from none to some or back; delivered only
  EReAdd = 1ull << 47,            ///< an add on an entry that is there reports Added
  EForce = 1ull << 48,            ///< every touched field is reported, equal or not
  EAdded = 1ull << 49,
  EChildAdded = 1ull << 50,
  EDescendantAdded = 1ull << 51,
  ERemoved = 1ull << 52,
  EChildRemoved = 1ull << 53,
  EDescendantRemoved = 1ull << 54,
  EVerificationNeeded = 1ull << 55 ///< EVerifyRequired is set, and the verified and proposed values differ
};

/// Groups of change bits.
namespace ChangeMask
{
inline constexpr std::uint64_t Values = 0x703ff;          ///< the three values and the flag word
inline constexpr std::uint64_t Presentation = 0x3f000000; ///< range, choices, texts
inline constexpr std::uint64_t Extras = 0xff00000000;     ///< optional and extra texts, numbers, attributes; and bit 39
inline constexpr std::uint64_t Fields = 0xff3f0703ff;     ///< the three groups
inline constexpr std::uint64_t Structural = 0xff800000000000; ///< never counted as a field
inline constexpr std::uint64_t Promotion = 0x36000000000000;  ///< moves up one bit on the way to the parent
inline constexpr std::uint64_t Replaced = EAdded | ERemoved;  ///< the pending record stands alone
inline constexpr std::uint64_t ChildStamp = EChildAdded | EChildRemoved;
inline constexpr std::uint64_t DescendantStamp = EDescendantAdded | EDescendantRemoved;
inline constexpr std::uint64_t Kept = EReAdd | EForce;    ///< survive a removal
inline constexpr std::uint64_t All = ~std::uint64_t( 0 ); ///< for a callback that wants to hear everything

static_assert( Fields == ( Values | Presentation | Extras ) && ( Fields & Structural ) == 0 );
static_assert( Replaced == 0x12000000000000 && ChildStamp == 0x24000000000000 && DescendantStamp == 0x48000000000000 );
} // namespace ChangeMask

} // namespace ZEK
