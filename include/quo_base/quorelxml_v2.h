// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_QUORELXML_V2_H
#define QUO_BASE_QUORELXML_V2_H

#ifndef __cplusplus
#error "quorelxml_v2.h declares C++ classes"
#endif

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <string_view>

#include "quo_base/api.h"

/** @file
 * The XML header document, and the registry through which every header object travels into and out of it.
 *
 * A header file has the root element `QuorelXmlDoc` with `NumberOfChannels`, `Description` and any number of
 * `Channel` elements, told apart by their attribute `Number`. Below a channel, a field path such as
 * "SamplingConstants/fc_hz" is a chain of nested elements. A single value is the text of its element; a numeric
 * array holds one child `val` per value, in order; a text array is a run of elements of the same name; values of
 * arrays carry their 1-based index in the attribute `N`. Ints are written with "%d", floats and doubles with
 * "%.15g".
 *
 * Channel numbers are the caller's (header objects use 1). Field paths are data: every part between slashes is
 * compared with element names, and a part that is no XML name (without colon) is refused with 1. Texts are UTF-8;
 * bytes that are not are taken as Latin-1 when written, and control characters, which XML cannot hold, are
 * refused.
 *
 * Headers are read without network access, without entity substitution and without loading of DTDs. A text above
 * ten million bytes, names above ten million bytes in all, a file above 1 GiB and a real lack of memory give 7,
 * and the file is never replaced by a fresh document. Nor is one that is there but cannot be opened or read (no
 * rights, no free descriptor, a failing disk), or that declares anything in a DTD of its own or nests deeper than
 * 256 elements: reading gives 4, a fresh document stands in for it in memory, and saving that gives 1. A document
 * in memory takes about the size of its file, eight times as much at most. File names hold at most 511 bytes; a
 * longer one is refused, never cut.
 *
 * Operations return 0, 1 (refused: missing field, bad argument, file that cannot be read or saved) or 7 (out of
 * memory) unless said otherwise. One object serves one thread at a time. Different
 * objects of one file are apart: the last that is saved stands. */

namespace quo {
class HeaderDocument;
class Record;
}  // namespace quo

/** One header document in memory. */
class QUO_BASE_API quorelxml {
public:
    /** Largest header file that is read, bytes. */
    static constexpr std::int64_t kMostFileBytes = 1LL << 30;

    /** An empty object: nothing loaded. */
    quorelxml() noexcept;
    /** Loads the file; when it is missing or no header document, a fresh document takes its place in memory, and
     * stands in for one that cannot be read. The disk is not touched before write(). */
    explicit quorelxml(const char* file_name) noexcept;
    ~quorelxml();
    quorelxml(const quorelxml&) = delete;
    quorelxml& operator=(const quorelxml&) = delete;

    /** Whether failures print messages (standard error) and enter the report (kind WARNING); off at first. Returns
     * 0. */
    int setDebug(bool debug) noexcept;
    /** As the constructor with a file name; what was loaded before is dropped.
     * @return 0; 1 for a name that does not fit, with a fresh document that has no file; 7, with none */
    int initXmlFile(const char* file_name) noexcept;
    /** Loads the file (or makes a fresh document), sets `Description`, saves and empties the object again.
     * @return 0; 1 for a name that does not fit, a text that XML cannot hold or a file that cannot be saved; 7. A
     * failure leaves the old file whole. */
    int setDescription(const char* file_name, const char* text) noexcept;
    /** Saves the document under its file name, freshly indented, UTF-8. The new file replaces the old one in one
     * step: when saving fails (1) the old file is still whole. A document that stands in for a file that could not
     * be read is not saved (1). */
    int write() noexcept;
    /** Drops the document; safe to call repeatedly. Returns 0. */
    int clean() noexcept;
    /** What is no XML in a file, the first place of it: "line 17: ..."; empty where all of it is, or cannot be
     * read. Throws bad_alloc. */
    static std::string xmlDefect(const char* file_name);

    /** Reads `count` values of a field into the caller's array.
     *
     * With count below 2 the field's own text is read, otherwise its `val` children; a field without any is read
     * as one list "1.5, 2.5, 3.5". Texts convert as with atoi and atof, whatever the locale. Where the file holds
     * fewer values than asked for, the rest of the array stays unchanged.
     * @return 0; 1 when the field is missing, with the array unchanged. */
    int readInt(int channel, const char* field, std::int32_t* values, int count) noexcept;
    int readFloat(int channel, const char* field, float* values, int count) noexcept;
    int readDouble(int channel, const char* field, double* values, int count) noexcept;
    /** Reads `count` texts, one per element bearing the field's name; values[i] must have room for the whole text.
     * @return 0; 1 when fewer than `count` elements are there, with the texts unchanged. */
    int readString(int channel, const char* field, char* const* values, int count) noexcept;
    /** As above, every text cut to `room` - 1 bytes (never inside a UTF-8 character). */
    int readString(int channel, const char* field, char* const* values, int count, std::size_t room) noexcept;

    /** Calls `see` with the whole text of every element that a field path leads to, in document order. An
     * exception of `see` ends the reading with 7. 0, also where there is none; 7. */
    int readTexts(int channel, const char* field, const std::function<void(std::string_view)>& see) noexcept;
    /** Calls `see` with the text of every element that a field path leads to, in the order of the file, while the
     * file is being read: no document is kept, so that arrays of any length take no memory. What was seen counts
     * only when 0 comes back.
     * @return 0, also where no element bears the path; 1 when the file is missing or no header document; 4 when it
     * is there but cannot be read; 7 */
    static int readTexts(const char* file_name, int channel, const char* field,
                         const std::function<void(std::string_view)>& see) noexcept;

    /** Writes `count` values of a field into the document in memory, creating channel and elements as needed;
     * write() saves them. Of elements beyond `count` none is removed. A count below 1 writes nothing.
     * @return 0; 1 for a field path or a text that XML cannot hold, with the document unchanged; 7, where some of
     * the values may have been written. */
    int writeInt(int channel, const char* field, const std::int32_t* values, int count) noexcept;
    int writeFloat(int channel, const char* field, const float* values, int count) noexcept;
    int writeDouble(int channel, const char* field, const double* values, int count) noexcept;
    int writeString(int channel, const char* field, const char* const* values, int count) noexcept;

    /** How floats and doubles are written by every document that has no choice of its own: "%.15g" while false,
     * as at first; with true the shortest text that reads back to the same double. Process-wide. */
    static void setExactNumbers(bool exact) noexcept;
    /** The same choice for this document alone. */
    void useExactNumbers(bool exact) noexcept;

protected:
    /** Loads the file under the stored name; 1 when there is no document, 4 when the file is there but cannot be
     * read, 7 when it does not fit into memory. */
    int parse() noexcept;
    /** Whether the document is a header; mirrors the number of channels and the description. */
    bool isRecognized() noexcept;
    /** Makes a fresh header document. */
    int createDocument() noexcept;
    /** Saves the document. */
    int flush() noexcept;
    /** The XPath expression of a channel, or of a field of it; for messages, not for evaluation. */
    static int setXpathExpression(int channel, std::string& expression);
    static int setXpathExpression(int channel, const char* field, std::string& expression);
    /** The first element (the one at `index`, from 0) of a field, or null. The handle can only be
     * compared, and holds until the document changes. */
    void* getNode(int channel, const char* field) const;
    void* getNode(int channel, const char* field, int index) const;
    /** How many elements a field path leads to, and whether there are any, or that many; 0 and false without a
     * document. */
    int countNodes(int channel, const char* field) const;
    bool channelExists(int channel) const;
    bool fieldExists(int channel, const char* field) const;
    bool fieldHasCount(int channel, const char* field, int count) const;
    /** Appends the channel, and the field's elements from the first that is missing on, where there is none yet; a
     * fresh document is made where there is no header. 0; 1 for a path that XML cannot hold; 7. */
    int createChannel(int channel) noexcept;
    int createField(int channel, const char* field) noexcept;
    /** Creates the field and appends to its parent until `count` elements bear its name. */
    int createField(int channel, const char* field, int count) noexcept;
    /** Removes every element of the field. 0, also where there is none. */
    int clearField(int channel, const char* field) noexcept;
    /** Builds the scan format of a list: type 0 double, 1 float, 2 int, 3 string; cut to whole items within 4096
     * characters. Lists are read with formats of their own, whose length does not grow with the list. */
    int setFormat(int count, int type);

    /** What the object holds: the format that setFormat() built, the file's name (empty without one), and mirrors
     * of the document's description and number of channels. */
    const std::string& format() const noexcept { return format_; }
    const std::string& fileName() const noexcept { return file_name_; }
    const std::string& description() const noexcept { return description_; }
    std::int32_t numberOfChannels() const noexcept { return number_of_channels_; }
    /** Whether there is a document in memory. */
    bool loaded() const noexcept { return document_ != nullptr; }
    /** Takes over the name of the file, nothing else. 0; 1 for one that does not fit, with no name left; 7. */
    int storeFileName(const char* file_name) noexcept;
    /** Inserts a processing instruction before the root element, unless something stands there already. */
    int insertInstruction(const char* name, const char* content) noexcept;

private:
    friend class GeneralSAR_BaseXML;

    struct __attribute__((visibility("hidden"))) Mirror;
    struct __attribute__((visibility("hidden"))) Values;
    enum class Exactness : std::uint8_t { kDefault, kExact, kRounded };

    void mirrorDescription(std::string_view text);
    void printMissing(int channel, const char* field) const;

    std::shared_ptr<quo::HeaderDocument> document_;  // shared with a header session while one is open
    std::string file_name_, description_, format_;
    std::int32_t number_of_channels_ = 0;
    bool debug_ = false;
    bool irreplaceable_ = false;  // the file does not fit into memory: no fresh document may replace it
    bool unreadable_ = false;     // the file could not be read: a fresh document stands in but is never saved
    Exactness exactness_ = Exactness::kDefault;
};

/** A header document with an `xml-stylesheet` instruction before its root element. */
class QUO_BASE_API quorelxmlPi : public quorelxml {
public:
    quorelxmlPi() noexcept = default;
    using quorelxml::initXmlFile;
    /** Loads the file and inserts the instruction for the style sheet at `stylesheet`, once: a document in which
     * something already precedes the root element stays as it is. */
    int initXmlFile(const char* file_name, const char* stylesheet) noexcept;
};

/** Which values of an element make sense, where its type and its bounds do not tell it all. */
struct parRule {
    /** What a text has to be. */
    enum Text : std::uint8_t {
        anyText,
        filledText,  ///< not empty
        listedText,  ///< one of `texts`
        dateText     ///< what date2str() reads
    };

    bool bounded = false;       ///< whether `lowest` and `highest` take the place of the element's bounds
    bool above_lowest = false;  ///< whether `lowest` itself is left out
    double lowest = 0.0;        ///< the lowest number, in the element's unit
    double highest = 0.0;       ///< the highest number; may be infinite
    Text text = anyText;        ///< for elements that hold texts
    std::span<const std::string_view> texts = {};  ///< not owned
};

/** One member of a header object: where it lives and how it appears in a header file. */
class QUO_BASE_API parElement {
public:
    /** Type of the values; those of typeNone are left out. */
    enum ParameterType { typeDouble = 0, typeFloat = 1, typeInt = 2, typeString = 3, typeNone = 4 };

    /** Room of a text member, bytes, the final NUL included. */
    static constexpr std::size_t kTextRoom = 512;

    char name[64] = "";             ///< element name in the object's section
    ParameterType type = typeNone;  ///< type of the values
    std::int32_t count = 0;         ///< number of values; 0: absent for now, skipped by reading and writing
    void* pointer = nullptr;        ///< the values: first number, text, or array of texts (char**); not owned
    double minimum = 0.0;           ///< lower bound, not enforced by reading and writing; 0 and 0: unbounded
    double maximum = 0.0;           ///< upper bound, likewise
    bool mandatory = false;         ///< a failed read of this element fails the whole read
    bool scalar = false;            ///< the first registration had count 1
    bool registered = false;        ///< set after the first registration; `scalar` is fixed from then on
    std::size_t room = kTextRoom;   ///< room of each text
    bool text_array = false;        ///< `pointer` is an array of texts, whatever the count
    parRule rule;                   ///< for defect() alone; reading and writing do not look at it
    const char* section = "";       ///< section that objects of the class usually stand in; empty where not told
    const char* unit = "";          ///< unit of the values, empty where they have none or it is not told
    const char* meaning = "";       ///< what the values are, or empty

    /** Describes the element anew. Before the first registration a count of 1 makes it a scalar. Returns 0. */
    int setElement(const char* element_name, void* values, ParameterType value_type, std::int32_t value_count,
                   double lowest, double highest, bool is_mandatory) noexcept;
    /** Calls `use` with the values in memory, a span of double, float, std::int32_t or char* (texts), empty while
     * there are none, and gives what it gives. */
    template <typename Use>
    auto withValues(Use use) const {
        const auto n = static_cast<std::size_t>(count > 0 ? count : 0);
        char* const text = type == typeString && !text_array ? static_cast<char*>(pointer) : nullptr;
        switch (type) {
            case typeDouble:
                return use(std::span{static_cast<double*>(pointer), n});
            case typeFloat:
                return use(std::span{static_cast<float*>(pointer), n});
            case typeInt:
                return use(std::span{static_cast<std::int32_t*>(pointer), n});
            case typeString:
                return use(text_array ? std::span{static_cast<char* const*>(pointer), n} : std::span{&text, n});
            case typeNone:
                break;
        }
        return use(std::span<char* const>{});
    }
    /** What is wrong with one value of the element, given as the text that stands in a header: "17 lies above 1";
     * empty where it makes sense. Numbers must be whole texts, finite, and within the rule's bounds, else the
     * element's own; texts must fit their room and meet the rule. Marks of unknown values (-999) are judged like
     * any other value. Throws bad_alloc. */
    std::string defect(std::string_view text) const;
    /** The same for the number of values: "has 3 values, not 1". Any number is right while `count` is 0. */
    std::string countDefect(std::size_t values) const;
};

/** Registry base of the header objects: one table of elements drives reading and writing.
 *
 * A derived class gives its members their defaults, calls createElementsVector() with the number of elements that
 * its refreshParameters() registers, and re-registers whenever its arrays move. Objects are neither copied nor
 * moved: the table points into them. */
class QUO_BASE_API GeneralSAR_BaseXML {
public:
    GeneralSAR_BaseXML() noexcept;
    GeneralSAR_BaseXML(const GeneralSAR_BaseXML&) = delete;
    GeneralSAR_BaseXML& operator=(const GeneralSAR_BaseXML&) = delete;

    /** Allocates the arrays whose lengths the scalar members now tell, and registers again. 0, 7, or 1 for a
     * length that the file at hand cannot hold. Here: nothing, 0. */
    virtual int createBuffers();
    /** Releases the arrays and sets their lengths to 0. Here: nothing, 0. */
    virtual int destroyBuffers();
    virtual ~GeneralSAR_BaseXML();

    /** Whether the table is released with the object; true at first. */
    int setParamListAlloc(bool owned) noexcept;
    bool isBufferAllocated() const noexcept;

    /** Attaches a header file: loads it (or makes a fresh document) for the operations without arguments. What was
     * attached before is detached.
     * @return 0; 1 for a file or section name that is empty (the section's) or has 512 bytes or more; 7 */
    int setAuxiliaryFile(const char* file, int channel, const char* section) noexcept;
    /** Detaches it again. Unsaved changes are dropped. Returns 0. */
    int unsetAuxiliaryFile() noexcept;
    /** Removes the object's section from the attached document; 0, also where there is none. */
    int cleanAuxiliaryFile() noexcept;
    /** Replaces the object's section in the attached document and saves it.
     * @return 0; 1 when the buffers are not allocated, a text cannot be stored or the file cannot be saved (with a
     * report entry, the old file still whole); 7. */
    int writeAuxiliaryFile() noexcept;
    /** Reads the object's section: the single values, then createBuffers(), then everything.
     * @return 0; 1 when a mandatory element is missing or the buffers cannot be had; 4 when the file is there but
     * could not be read; 7, also where only an optional element found no memory; what was read stays. */
    int readAuxiliaryFile() noexcept;
    /** Attach, write, detach. 0, or the failing status of the write. */
    int writeAuxiliaryFile(const char* file, int channel, const char* section) noexcept;
    /** Attach, read, detach. True on success. A file that does not exist is not created. After a failure for want
     * of memory, or of a file that could not be read, the object takes nothing from another form of the file. */
    bool readAuxiliaryFile(const char* file, int channel, const char* section) noexcept;
    /** Always true. */
    bool checkAuxiliaryFile() const noexcept;
    bool checkAuxiliaryFile(const char* file, int channel, const char* section) const noexcept;
    /** Reads the text `ConfigurationFile` of a section, cut to `room` - 1 bytes; true when it is there. */
    bool getConfigurationFile(const char* file, int channel, const char* section, char* text,
                              std::size_t room) noexcept;
    /** As above into a buffer of 512 bytes. */
    bool getConfigurationFile(const char* file, int channel, const char* section, char* text) noexcept;

    /** How this object writes floats and doubles; see quorelxml::setExactNumbers, which rules where this was never
     * called. */
    void setExactNumbers(bool exact) noexcept;

    /** Number of elements, and the element at `index` (from 0; null beyond): for tools that list, compare or
     * document a header object without knowing its class. Defaults are what a new object of the class shows. */
    int elementCount() const noexcept;
    const parElement* element(int index) const noexcept;

protected:
    /** Registers every element, always as many in the same order, and ends with setAllocationFlag(true). */
    virtual void refreshParameters();

    /** Makes the table with `count` slots and fills it by refreshParameters(); called by the derived constructor.
     * A table that another base class made before is released. 0, 1 or 7. */
    int createElementsVector(int count);
    /** Each fills the next slot, the first one again after the last. 0; 1, with the pending errors cleared, when
     * the table has no slots. `values` is not owned; a count of 0 stands for an array that is not allocated. */
    int addElementDouble(const char* name, double* values, int count, double minimum, double maximum,
                         bool mandatory);
    int addElementFloat(const char* name, float* values, int count, float minimum, float maximum, bool mandatory);
    int addElementInt(const char* name, std::int32_t* values, int count, int minimum, int maximum, bool mandatory);
    /** A single text with room for 512 bytes. */
    int addElementString(const char* name, char* text, bool mandatory);
    /** An array of texts with room for 512 bytes each. */
    int addElementString(const char* name, char** texts, int count, bool mandatory);
    /** A single text with room for `room` bytes. */
    int addElementText(const char* name, char* text, std::size_t room, bool mandatory);
    /** Whether the object's arrays are allocated and its table is complete: without it nothing is written, and
     * nothing read beyond the single values. */
    int setAllocationFlag(bool allocated) noexcept;
    /** Forgets the table, and releases it while setParamListAlloc() says so. */
    int destroyElementsVector() noexcept;

    /** Whether the file that is being read is large enough for `count` values: asked before memory is taken for a
     * length that came from it. False for a negative count; without a file at hand any other count may be. */
    bool sourceCanHold(std::int64_t count) const noexcept;

private:
    friend class quo::Record;

    std::span<const parElement> elements() const noexcept {
        return {elements_, static_cast<std::size_t>(element_count_)};
    }
    int addElement(const char* name, void* values, parElement::ParameterType type, int count, double minimum,
                   double maximum, bool mandatory);
    int attach(const char* file);
    bool textsCanBeStored() const;
    int writeElement(const parElement& element);
    int writeSection();
    int readElement(const parElement& element, int count);
    int readScalars(bool& lengths_changed);
    bool hasArrays() const noexcept;
    int readEverything();
    int readSection();

    std::int32_t element_count_ = 0;
    std::int32_t cursor_ = 0;
    parElement* elements_ = nullptr;  // owned while list_owned_ is set
    bool allocated_ = false;
    bool list_owned_ = true;
    bool table_refused_ = false;   // no memory for the table: the object can neither be read nor written
    bool out_of_buffers_ = false;  // the last read found no memory for the arrays
    std::int32_t unread_ = 0;      // 4 or 7 when the last read of a file failed for that, else 0
    quorelxml document_;
    std::int32_t channel_ = 0;
    std::string section_;
    std::int64_t source_length_ = -1;  // bytes of the file being read, -1 while there is none
};

/** Base of every header object. Its own header operations do nothing and return 0. */
class QUO_BASE_API GeneralSAR_Base : public GeneralSAR_BaseXML {
public:
    int createBuffers() override;
    int destroyBuffers() override;
    ~GeneralSAR_Base() override;

protected:
    void refreshParameters() override;

public:
    /** Writes the object to a file of its own. */
    virtual int writehdr();
    /** Writes the object's section into the header file, replacing an older one. 0 or a failing status. */
    virtual int writehdr(const char* file);
    /** Reads the object's section from the header file. 0 or a failing status. */
    virtual int readhdr(const char* file);
};

#endif
