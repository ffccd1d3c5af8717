// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_MISSION_XML_H
#define QUO_MISSION_XML_H

#include <cstdint>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "quo_base/api.h"
#include "sarutillib/ground/iso_time.h"

// NOLINTNEXTLINE(bugprone-reserved-identifier,readability-identifier-naming): libxml2's own name
extern "C" struct _xmlNode;

namespace quo {

/** Why a product of another mission cannot be taken over: a status and one line that names the file. */
class MissionRefusal : public std::runtime_error {
public:
    MissionRefusal(int status, const std::string& line) : std::runtime_error{line}, status_{status} {}
    [[nodiscard]] int status() const { return status_; }

private:
    int status_;
};

/** Refuses a file that cannot be opened, for the reason that errno holds. */
[[noreturn]] void refuse_opening(const std::string& file);

/** An XML file of a mission, in memory. */
class MissionXml {
public:
    /** An element and what stands in it. Valid as long as its file. Paths are element names with slashes between
     * them, prefixes of namespaces left out; the first of several elements of a name counts. */
    class Element {
    public:
        Element(_xmlNode* node, const MissionXml* file) : node_{node}, file_{file} {}

        [[nodiscard]] std::optional<Element> find(std::string_view path) const;
        /** All elements of a name below the one at `path`. */
        [[nodiscard]] std::vector<Element> list(std::string_view path, std::string_view name) const;
        [[nodiscard]] std::string text() const;
        [[nodiscard]] std::string attribute(const char* name) const;

        /** @name Values at a path
         * A missing element, or one that holds something else, is refused. Numbers are finite.
         * @{ */
        [[nodiscard]] Element at(std::string_view path) const;
        [[nodiscard]] std::string text(std::string_view path) const;
        [[nodiscard]] double number(std::string_view path) const;
        [[nodiscard]] std::int32_t integer(std::string_view path) const;
        [[nodiscard]] SplitTime time(std::string_view path) const;
        [[nodiscard]] std::vector<double> numbers(std::string_view path) const;
        /** @} */
        [[nodiscard]] bool truth(std::string_view path) const;  ///< false where it is missing

        [[noreturn]] void refuse(const std::string& why, int status = QUO_REFUSED) const;

    private:
        _xmlNode* node_;
        const MissionXml* file_;
    };

    /** Reads the file, which may be kMostBytes long; refuses what is missing, too long or no XML, and a document
     * type of its own, whose entities could unfold without end. */
    explicit MissionXml(const std::string& file);
    ~MissionXml();
    MissionXml(MissionXml&&) = delete;

    [[nodiscard]] Element root() const;
    [[nodiscard]] const std::string& name() const { return name_; }

    static constexpr std::int64_t kMostBytes = 64 << 20;

private:
    std::string name_;
    void* document_;
};

}  // namespace quo

#endif
