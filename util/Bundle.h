/**
 * @file
 * The typed settings tree.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "talvox/Export.h"

class TiXmlElement;
class TiXmlNode;

namespace Util {

/**
 * Maps normalised keys to typed elements; an element may hold another bundle.
 *
 * Keys: every operation normalises its key first, so "Sample_Rate", "sample-rate" and "SAMPLE RATE"
 * all name the element "samplerate".
 *
 * Threads: a bundle has no lock. One thread builds and changes it; afterwards it is shared
 * read-only. Whoever changes a bundle that others may read makes a `clone`, changes that and
 * publishes the new pointer. Nothing here blocks (but for the log sink).
 *
 * Failures: reading a key that is missing or of another type is a broken invariant and reported to
 * the assertion handler; where that returns, the value read means nothing.
 */
class TALVOX_API Bundle {
  public:
    /** Type of an element; the numbers are fixed. */
    enum ElemType : int { BOOLEAN = 0, INT = 1, FLOAT = 2, LATLON = 3, STRING = 4, BUNDLE = 5 };

    /** A position in degrees. */
    struct LatLon {
        /** Latitude and longitude. */
        float lat = 0.0F;
        float lon = 0.0F;
    };

    /** One element. Only the payload that `type` names means something. */
    struct TALVOX_API Elem {
        /** Which payload counts. */
        ElemType type = BOOLEAN;
        /** Payload of three types: a boolean as 0 or 1, an integer's bits, a float's bits. */
        std::uint32_t scalar = 0;
        LatLon latLon;
        std::string text;
        /** Shared with whoever else holds it, never copied along with the element. */
        boost::shared_ptr<const Bundle> bundle;

        /** The scalar as each of its three types; safe whatever it holds. */
        bool asBoolean() const;
        int asInt() const;
        float asFloat() const;
    };

    /**
     * One row of a table of the keys that a bundle holds, which is an array ended by a row with a
     * null name. A null pointer in place of a table counts as a table without rows.
     */
    struct ElemSpec {
        const char* name;        /**< in normalised spelling */
        ElemType type;           /**< the type that the key must have */
        const ElemSpec* subSpec; /**< the table of a `BUNDLE`; null for other types */
    };

    Bundle() = default;
    Bundle(const Bundle&) = default;
    Bundle& operator=(const Bundle&) = default;
    virtual ~Bundle();

    /** Stores an element in place of any old one, whatever the type of that. */
    void put(const std::string& key, const Elem& elem);
    void putBoolean(const std::string& key, bool value);
    void putInt(const std::string& key, int value);
    void putFloat(const std::string& key, float value);
    void putLatLon(const std::string& key, const LatLon& value);
    void putString(const std::string& key, const std::string& value);
    /** Stores the pointer itself: the sub-bundle is shared with the caller. */
    void putBundle(const std::string& key, const boost::shared_ptr<const Bundle>& value);

    /** The element of a key that must be present. Valid until the key is put again. */
    const Elem& get(const std::string& key) const;
    bool getBoolean(const std::string& key) const;
    int getInt(const std::string& key) const;
    float getFloat(const std::string& key) const;
    LatLon getLatLon(const std::string& key) const;
    /** Valid until the key is put again. */
    const std::string& getString(const std::string& key) const;
    boost::shared_ptr<const Bundle> getBundle(const std::string& key) const;

    /** The type of a key that must be present. */
    ElemType getType(const std::string& key) const;
    /** Never fails. */
    bool hasKey(const std::string& key) const;

    /** All keys, normalised, in the bundle's order. */
    std::vector<std::string> getKeys() const;

    /** A new bundle with the same elements; sub-bundles are shared with this one. */
    boost::shared_ptr<Bundle> clone() const;

    /**
     * True when the bundle holds every key of the table with the row's type, sub-bundles
     * recursively, and no other key. A table must spell its names in normalised form.
     */
    bool conformsTo(const ElemSpec* spec) const;

    /** Removes "_", "-" and blanks, then maps A to Z to lower case; other bytes stay. */
    static std::string normalizeKey(const std::string& key);

    /**
     * Writes the bundle for diagnostics: one element per key, in the order of the keys, within an
     * element `name`. Texts are not escaped, so the outcome need not be well-formed.
     */
    std::string toXmlString(const std::string& name) const;

    /**
     * Updates the bundle from the children of one XML element: a child's name is the key (in any
     * spelling that normalises to it), its text the value.
     *
     * Only keys of the table are stored, each with its row's type; nothing is ever removed. Each of
     * these repairs is logged:
     * - a name that is not in the table, or whose old value is not a bundle where the table wants
     *   one, is skipped;
     * - a number out of range, infinity included, becomes the nearest number of its type, so that
     *   validation finds it where the range is narrower;
     * - what follows a number is ignored ("12abc" is 12, and "0,5" is 0: the decimal mark is ".");
     * - a text that does not begin with a number ("nan", "abc", none at all) leaves the old number
     *   as it is; where there is none, it stores 0;
     * - of a position, the part that is not a number is 0, and so is the part behind it;
     * - a boolean is false for "", "0", "false" and "no" in any case, and true for any other text,
     *   so also for "off".
     *
     * @param node  where the path starts
     * @param path  names of nested elements, separated by "/"; empty pieces are skipped
     * @param spec  the keys that may be stored
     */
    void updateFromXml(const TiXmlNode& node, const std::string& path, const ElemSpec* spec);

    /**
     * The same for a text. What can be used of a text with errors is applied, and the first error
     * is logged with its place: all before a byte that is not UTF-8 or a bad character reference,
     * but nothing of the value in which it stands; after a syntax error, what the parser had read.
     * A text that is too large or nested too deeply changes nothing. For the exact rules, and for
     * documents in a single-byte encoding, see `Util::XmlUtils::loadUsable`.
     */
    void updateFromXml(const std::string& xml, const std::string& path, const ElemSpec* spec);

    /**
     * The same for a text that is used as a whole or not at all: with an error in the text itself,
     * or without the path, the bundle stays as it is. Names and values are repaired as above.
     * @return an empty text when the update was made, else the first error in plain words
     */
    std::string updateFromWholeXml(const std::string& xml, const std::string& path,
                                   const ElemSpec* spec);

  private:
    static const ElemSpec* findRow(const ElemSpec* spec, const std::string& key);

    const Elem& getTyped(const std::string& key, ElemType type, const char* condition) const;
    void updateElement(const TiXmlElement& element, const ElemSpec* spec);
    void updateSubBundle(const TiXmlElement& element, const std::string& key,
                         const ElemSpec* subSpec);

    std::map<std::string, Elem> rep;
};

}  // namespace Util
