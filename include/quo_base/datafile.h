// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_DATAFILE_H
#define QUO_BASE_DATAFILE_H

#include "quo_base/api.h"

#ifdef __cplusplus
#include <memory>
#include <optional>

#include "quo_base/quorelxml_v2.h"
#endif

/** @file
 * Raster files: flat binary files of lines of samples, each described by a side file of the same name with ".hdr"
 * appended.
 *
 * A raster is HeaderOffset bytes, then NrOfLinesPerImage lines, each RowPrefix bytes followed by NrOfPixelsPerLine
 * samples. Sample s of line l stands at HeaderOffset + l * (NrOfPixelsPerLine * size + RowPrefix) + RowPrefix + s
 * * size. Numbers have the byte order that the description names; complex samples are a real and an imaginary
 * part, each in that order. Lines and samples count from 0. Positions are 64-bit.
 *
 * Statuses: 0; 1 refused (wrong state, a bad argument, a description whose sizes are negative or overflow, an
 * unsupported cell type, a missing header key); 4 "File reading failed!", also for a region that ends beyond the
 * file, which is found before memory is taken; 5 "File writing failed!"; 7 no memory; 9 "File not opened!".
 *
 * One object serves one thread at a time. Threads that read one raster at the same time have an object each; so
 * have threads that write parts of it which do not overlap, without a buffer (mode 2). */

/** Cell types: the codes that descriptions and memory types use. Integers are signed. */
enum RasterCellType {
    FLOAT_COMPLEX = 0,  /**< two 32-bit floats */
    FLOAT32 = 1,        /**< 32-bit float */
    DOUBLE_COMPLEX = 2, /**< two 64-bit floats */
    FLOAT64 = 3,        /**< 64-bit float */
    INT_COMPLEX = 4,    /**< two 32-bit integers; has no name in side files of the profile form */
    INT32 = 5,          /**< 32-bit integer */
    SHORT_COMPLEX = 6,  /**< two 16-bit integers */
    INT16 = 7,          /**< 16-bit integer */
    INT8_COMPLEX = 8,   /**< two 8-bit integers */
    INT8 = 9,           /**< 8-bit integer */
    CELL_NOT_SET = 10   /**< a new BufferFile's */
};

#ifdef __cplusplus

namespace quo {
class AtomicFile;
class RasterStream;
struct RasterRegion;
struct RegionLayout;
}  // namespace quo

/** The description that both raster classes hold. Section "RasterInfo" of the side file, six integers. */
class QUO_BASE_API RasterDescription : public GeneralSAR_Base {
public:
    RasterDescription();
    ~RasterDescription() override;

    /** Bytes of one sample; 0 for a code that is no cell type. */
    [[nodiscard]] int element_sizeof() const;
    /** 1 for codes 0, 2, 4, 6 and 8, else 0. */
    [[nodiscard]] int is_complex() const;
    /** Takes HeaderOffset over from its element, where that was set since the last reading, copying or writing.
     * Returns 0. */
    int createBuffers() override;
    /** Copies the six values of the description. */
    void copyDescription(const RasterDescription& from);
    /** Bytes from the start of the file to the end of the last line, or -1 when the description makes no raster: a
     * negative count, an unknown cell type, a size beyond 64 bits. */
    [[nodiscard]] int64_t rasterSize() const;

    int32_t NrOfLinesPerImage = 0;  ///< lines
    int32_t NrOfPixelsPerLine = 0;  ///< samples per line
    int64_t HeaderOffset = 0;       ///< bytes before the first line; its element and side files hold 32 bits of it
    int32_t RowPrefix = 0;          ///< bytes before the samples of each line
    int32_t ByteOrder = 0;          ///< 1 big-endian ("MSBFirst"), 0 little-endian
    int32_t CellType = 0;           ///< RasterCellType

protected:
    void refreshParameters() override;
    /** Reads the section from an XML side file; 0 or 1. */
    int readSection(const char* side_file);
    /** Reads it from a side file of the profile form, whose CellType and ByteOrder are names. False when a key is
     * missing or the cell type unknown, with the values found taken over. */
    __attribute__((visibility("hidden"))) bool readNames(const char* side_file);
    /** Writes it; 0 or a failing status, 1 also for a HeaderOffset that an integer of the file cannot hold. */
    int writeSection(const char* side_file);
    /** Makes the element of HeaderOffset show it, where it is beyond 32 bits the nearest number that they hold. */
    void showOffset();
    /** Makes a new raster and its side file, with this description, the files of their names, both or neither but
     * for what DataFile::copy() tells. An older side file keeps its other sections. 0; 1 as writeSection(); 5, 7;
     * 9 where the side file cannot be replaced. */
    int commitPair(quo::AtomicFile& raster, const char* side_file);
    /** Copies a raster and describes the copy in its side file, as commitPair() does; otherwise as
     * DataFile::copy(). */
    int copyPair(const char* from, const char* to, bool overwrite);

private:
    struct __attribute__((visibility("hidden"))) Table;

    int32_t stored_offset_ = 0;  // the element of HeaderOffset
};

/** A raster file with plain and buffered byte access.
 *
 * Unbuffered, every transfer goes to the file. With a buffer (BufferSize set between read_hdr() and open()) small
 * transfers are served from it. seek(), tell() and close() follow fixed arithmetic, told with each of them. */
class QUO_BASE_API DataFile : public RasterDescription {
public:
    DataFile();
    /** Closes the file as close() does. */
    ~DataFile() override;

    /** Opens the raster: mode 0 for reading, 1 creates it for writing, 2 for writing into an existing one, 3 for
     * reading and writing. Any other mode opens nothing and returns 0. A file that is open is closed first. 0,
     * 7, 9. */
    int open(int mode);
    /** Closes the file. In mode 1 and 2 pending bytes of the buffer are written first (5 leaves the file open); in
     * mode 3 they are dropped, and only a seek() before writes them. The buffer is released and BufferSize becomes
     * 0, so that a closed file is unbuffered until the size is set again. 0 with no open file. */
    int close();
    /** Moves to another place. Unbuffered: whence 0 from the start, 1 from the current position. Buffered and
     * writing (modes 1 to 3): the pending bytes are written, then the position grows by `offset` for either
     * whence. Buffered and reading: whence 0 stays within the buffer when the target lies after its start and
     * before its end; whence 1 likewise, else the target is measured from the start of the buffer, not from the
     * place within it.
     * 0; 1 for another whence, a closed file or a place before the start; 5. */
    int seek(int64_t offset, int whence);
    /** Reads n bytes. 0; 1 in modes 1 and 2 or for a negative n; 4 where fewer are left, unbuffered with the
     * position as it was; 5 in mode 3, where pending bytes could not be written first. */
    int read(char* dst, int64_t n);
    /** Writes n bytes. 0; 1 in mode 0 or for a negative n; 5, with what was pending before still pending. */
    int write(const char* src, int64_t n);
    /** The position; buffered, the file offset of the buffer's start plus the cursor in it. */
    [[nodiscard]] int64_t tell() const;

    [[nodiscard]] int is_open() const;      ///< 1 while a file is open
    [[nodiscard]] int is_buffered() const;  ///< 1 when BufferSize is positive
    [[nodiscard]] int is_writing() const;   ///< access state: 0 reading, 1 writing, 2 both
    [[nodiscard]] int exists() const;       ///< 1 when the raster can be opened for reading

    /** Takes `file_name` as the raster's name and reads its side file: the XML form, else the profile form,
     * section "RasterInfo" with CellType and ByteOrder as names. An open file is closed. 0; 1 when a key is
     * missing or the cell type unknown (CellType is then -1), with the values found taken over; 7. */
    int read_hdr(const char* file_name);
    /** Writes the side file in XML form. 0; 1, also without a name, or 7, with the old one whole. */
    int write_hdr();
    /** Takes over another file's name and description, buffer size included; opens nothing. This file is closed
     * first. 0 or the status of the close. */
    int clone(const DataFile* source);
    /** Writes raster and side file under another name. Both become new together when all of it is on the disk;
     * until then, and whenever anything fails, older ones stay as they are. Two exceptions: where both have to be
     * written in place, as in a folder that takes no new files, a failure in that last step can leave a mixture;
     * and a process that is killed between the two renames leaves the new raster beside the old description.
     * Permissions of older files are kept, symbolic links to them followed; their side file keeps its other
     * sections. A raster of a new name grants group and others no more than its source does. With `overwrite` 0 an
     * existing raster is kept and 1 returned. 0; 1 also where the copy's raster or side file is the source's, by
     * whatever name, or both are one file; 4, 5, 7; 9 also where either file cannot be made. */
    int copy(const char* file_name, int overwrite = 1);

    /** Names the raster; a name of 512 bytes or more is refused (1). */
    int setFilename(const char* file_name);

    char FileName[512] = "";  ///< raster path
    int32_t BufferSize = 0;   ///< bytes of the buffer, taken by open(); 0: unbuffered

private:
    friend class BufferIO;

    [[nodiscard]] std::string path() const;
    [[nodiscard]] std::string sideFile() const;
    int refill();
    int flushBuffer();
    int readBuffered(char* dst, int64_t n);
    int writeBuffered(const char* src, int64_t n);
    int writeDirectly(const char* src, int64_t n);
    int seekWriting(int64_t offset);
    int seekReading(int64_t offset, int whence);
    int prepareRegion(int64_t next);
    int read(const quo::RasterRegion& region, const quo::RegionLayout& layout, char* dst, int64_t next);
    int write(const quo::RasterRegion& region, const quo::RegionLayout& layout, const char* src, int64_t next);

    std::unique_ptr<quo::RasterStream> stream_;
    std::unique_ptr<char[]> buffer_;
    int64_t position_ = 0;
    int32_t buffer_size_ = 0;  // bytes of buffer_, whatever BufferSize says meanwhile
    int32_t cursor_ = 0, fill_ = 0, state_ = 0;
    bool pending_ = false;  // the buffer holds bytes before its cursor that the file does not have yet
};

/** Reads or writes a rectangle of lines and samples through a DataFile, converting between its cell type and the
 * caller's.
 *
 * Reading takes any of the types 0 to 7 as it is and converts SHORT_COMPLEX, INT_COMPLEX, DOUBLE_COMPLEX and all
 * real types to FLOAT_COMPLEX; INT16, INT32 and FLOAT64 to FLOAT32; INT32 to INT16 and INT_COMPLEX to
 * SHORT_COMPLEX (low 16 bits) and back; FLOAT_COMPLEX, SHORT_COMPLEX, INT_COMPLEX and FLOAT64 to DOUBLE_COMPLEX;
 * FLOAT32, INT16 and INT32 to FLOAT64. Any other pair leaves the destination untouched, with status 0. Writing
 * converts between all complex and between all real types (into integers rounded half away from zero and held at
 * the bounds, between integers the low bits), and real samples into complex files of the same kind; any other pair
 * is refused. */
class QUO_BASE_API BufferIO {
public:
    /** A region of `file`, which the caller keeps. `memory_type` is the cell type of the caller's buffers. */
    BufferIO(DataFile* file, int first_sample, int samples, int first_line, int lines, int memory_type);

    /** Reads the line prefixes of the region's lines, RowPrefix bytes a line, packed, into dst. Opens a closed
     * file for reading and leaves it open, at the line after the region. 0; 1 for a file that is open for writing
     * only or a description that makes no lines; 4, 5, 7, 9. */
    int readprefix(char* dst);
    /** Reads the region into dst, whose rows are `width` samples of the memory type apart. Opens a closed file for
     * reading and leaves it open, at the line after the region. 0; 1 for 8-bit types, a region outside the lines,
     * a width smaller than the region or a file that is open for writing only; 4, 5, 7, 9. */
    int readbuffer(char* dst, int width);
    /** Writes the line prefixes of the region's lines, packed in src. 0; 1 for a file that is not open for writing
     * or a description that makes no lines; 5, 7. */
    int writeprefix(const char* src);
    /** Writes the region from src, whose rows are `width` samples of the memory type apart: as many as the region
     * has samples unless told. 0; 1 for a file that is not open for writing, a pair of types that is not written,
     * a region outside the lines or a width smaller than it; 5, 7. */
    int writebuffer(const char* src);
    int writebuffer(const char* src, int width);

    DataFile* File;       ///< the raster
    int32_t FirstSample;  ///< first sample of the region, counted from 0
    int32_t Samples;      ///< number of samples in a line of the region
    int32_t FirstLine;    ///< first line of the region, counted from 0
    int32_t Lines;        ///< number of lines
    int32_t MemoryType;   ///< RasterCellType of the caller's buffers

private:
    int openForReading();
    [[nodiscard]] bool prefixRegion(quo::RasterRegion& region) const;
};

/** A raster file with a sliding buffer and typed block access.
 *
 * Reports nothing: operations return counts or nothing, and requests that cannot be met are ignored; what the
 * system refused is kept by status(). The buffer keeps the target of a seek in its middle (writing) or `keep`
 * bytes after its start (reading), so that small steps back and forth stay in memory; what is read and written is
 * what a plain file would give. */
class QUO_BASE_API BufferFile : public RasterDescription {
public:
    /** How the file is open. */
    enum OperationType { NOT_OPEN = 0, READ = 1, WRITE = 2, READ_WRITE = 3 };
    /** Where a seek counts from. */
    enum SeekType { FROM_START = 0, FROM_CURRENT = 1, FROM_END = 2 };
    /** RasterCellType by its older name. */
    using UnitType = RasterCellType;

    /** A closed file without a name. */
    BufferFile();
    /** A closed file of this name, as setFilename() takes it. */
    explicit BufferFile(const char* file_name);
    /** Closes the file as close() does. */
    ~BufferFile() override;

    /** Reads the side file of this name; the raster's name is this name less its last four characters. 0 or 1. */
    int readhdr(const char* header_name) override;
    /** Reads the side file of the raster. 0; 1 also without a name. */
    int readhdr();
    /** Writes the side file of the raster. 0; 1, also without a name, with the old one whole. */
    int writehdr() override;
    /** Writes a side file of this name. 0 or 1, with the old one whole. */
    int writehdr(const char* header_name) override;

    void setFilename(
        const char* file_name);  ///< names the raster; 512 bytes or more are no name: it becomes empty
    void getFilename(char* file_name) const;  ///< copies the name into a buffer of 512 bytes
    /** Samples of a line. */
    void setSamples(int samples) { NrOfPixelsPerLine = samples; }
    [[nodiscard]] int getSamples() const { return NrOfPixelsPerLine; }
    /** Lines of the raster. */
    void setLines(int lines) { NrOfLinesPerImage = lines; }
    [[nodiscard]] int getLines() const { return NrOfLinesPerImage; }
    /** Bytes before the samples of each line. */
    void setRowPrefix(int bytes) { RowPrefix = bytes; }
    [[nodiscard]] int getRowPrefix() const { return RowPrefix; }
    /** The samples' type, a RasterCellType. */
    void setType(int type) { CellType = type; }
    [[nodiscard]] int getType() const { return CellType; }
    [[nodiscard]] int64_t getOffsetSize() const { return HeaderOffset; }  ///< bytes before the first line
    [[nodiscard]] int getFileEndian() const { return ByteOrder; }         ///< 1 big-endian, 0 little-endian
    [[nodiscard]] int getOpType() const { return mode_; }                 ///< OperationType
    /** Bytes of a sample; as element_sizeof(). */
    [[nodiscard]] int pixelsizeof() const { return element_sizeof(); }
    [[nodiscard]] bool is_open() const;                           ///< whether open() has opened the raster
    [[nodiscard]] bool is_buffered() const { return size_ > 0; }  ///< whether initbuffer() has given it a buffer
    [[nodiscard]] bool exists() const;                            ///< whether the raster can be opened for reading
    /** Whether it is open for writing. */
    [[nodiscard]] bool is_writing() const { return mode_ == WRITE || mode_ == READ_WRITE; }

    /** Opens the raster; READ_WRITE needs it to exist. A file that is open is closed first, and one that cannot be
     * opened leaves it closed. Any other mode opens and closes nothing: a file that is open goes to its start. */
    void open(int mode);
    /** Starts a new raster of this name, open in mode WRITE: it is written beside an older one, which stays as it
     * is, its side file too, until commit(). Closed without that, the new one goes. 0; 1 without a name; 7; 9
     * where the raster or its side file cannot be replaced. */
    int create();
    /** The raster that create() started is complete: when all of it is on the disk, it and a side file with its
     * description take their names, both or neither but where both have to be written in place or the process is
     * killed in that step, as DataFile::copy() tells. Permissions, links and other sections are kept as there.
     * The file is closed in any case. 0; 1 without create() or where the description makes no raster; 5 also where
     * fewer bytes were written than it needs; the first failure before; 7, 9. */
    int commit();
    /** Gives the open file a buffer of `size` bytes. A file that is written stays at its place; in mode READ it
     * goes to its start, and `keep` bytes (at most size - 1) of what was passed stay when the buffer slides.
     * Ignored for a closed file, for size < 1 and while an older buffer cannot be written; without memory the
     * file is unbuffered. */
    void initbuffer(int size, int keep);
    /** Writes what is pending and closes the file; the buffer is released. status() tells afterwards whether
     * everything has arrived. */
    void close();
    /** What became of everything asked for since open(), the closing of the file before included: 0, or the
     * status of the first failure, which stays until the next open(). 4 where the system refused to read (the end
     * of the file is no failure, unless a block or a single sample lies beyond it); 5 where bytes could not be
     * written: at once, or later what a buffer held, by seek(), close() or any other call; 7 without memory; 9
     * where the file could not be opened. Requests that are ignored leave it alone. */
    [[nodiscard]] int status() const { return status_; }
    /** The system's error number that came with status(); 0 where it gave none. */
    [[nodiscard]] int systemError() const { return error_; }
    /** Moves to another place; a place before the start is ignored. An offset of 0 changes nothing, whatever the
     * type. What a buffer held and could not be written is given up when the place leaves the buffer. */
    void seek(int64_t offset, int type);
    /** The place of the next byte; with a buffer in mode READ_WRITE, the place of the buffer's start.
     */
    [[nodiscard]] int64_t tell() const;
    /** Bytes read: fewer than n at the end of the file, 0 in mode WRITE. */
    int read(void* dst, int n);
    /** Bytes written: fewer than n when the disk is full, 0 in mode READ. What a full disk did not take of a
     * buffer stays pending and is tried again with the next write, block or close(); a seek() out of the buffer
     * gives it up. */
    int write(const void* src, int n);
    /** Copies n bytes from the place of another file, open for reading, to the place of this one, as they stand;
     * the system copies them where it can. Both places move on by n. 0; 1 while either file is not open for that,
     * for this file itself, for ranges of one file on disk that overlap and for n < 0; 4 where the source cannot
     * be read or ends before, which its status() then tells; 5, 7. After a failure the places stay, and some bytes
     * may have been written. */
    int copyFrom(BufferFile& source, int64_t n);

    /** @name Blocks
     * `lines` lines of `samples` samples (0: all of a line) from or to a packed array. Real types convert between
     * FLOAT32, FLOAT64, INT32 and INT16 files, complex ones between FLOAT_COMPLEX, DOUBLE_COMPLEX, INT_COMPLEX and
     * SHORT_COMPLEX; values going to an integer type are rounded half away from zero and held at its bounds, no
     * number becomes 0. Any other combination, a closed file, a file in mode WRITE (reading) or READ (writing), or
     * a block that does not lie within the lines or, reading, the file, leaves everything untouched. Afterwards
     * the place is the line after the block. From `double`, only FLOAT64, INT32 and INT16 files are
     * written; from `fcomplex`, DOUBLE_COMPLEX files are not written, and FLOAT64 files get two doubles for each
     * of the `samples`, where lines without room for them grow: the next one follows at once.
     * @{ */
    /** Reads a block into a packed array. */
    void readbuffer(float* dst, int first_line, int lines, int first_sample, int samples);
    void readbuffer(double* dst, int first_line, int lines, int first_sample, int samples);
    void readbuffer(int* dst, int first_line, int lines, int first_sample, int samples);
    void readbuffer(short* dst, int first_line, int lines, int first_sample, int samples);
    void readbuffer(fcomplex* dst, int first_line, int lines, int first_sample, int samples);
    void readbuffer(dcomplex* dst, int first_line, int lines, int first_sample, int samples);
    /** Writes a block from a packed array. */
    void writebuffer(const float* src, int first_line, int lines, int first_sample, int samples);
    void writebuffer(const double* src, int first_line, int lines, int first_sample, int samples);
    void writebuffer(const int* src, int first_line, int lines, int first_sample, int samples);
    void writebuffer(const short* src, int first_line, int lines, int first_sample, int samples);
    void writebuffer(const fcomplex* src, int first_line, int lines, int first_sample, int samples);
    void writebuffer(const dcomplex* src, int first_line, int lines, int first_sample, int samples);
    /** @} */
    /** The prefixes of some lines, RowPrefix bytes a line, packed; ignored as blocks are. */
    void readprefix(char* dst, int first_line, int lines);
    void writeprefix(const char* src, int first_line, int lines);
    /** Writes the first n bytes of the file header, at most HeaderOffset, and returns to the place before. */
    void writeOffset(const char* src, int n);

    /** @name Single samples, as they stand in the file
     * 0 unless the file is open in mode READ or READ_WRITE, holds just this type, is little-endian and has the
     * sample. The place moves behind it.
     * @{ */
    /** The sample of a line, both counted from 0. */
    float readFloat(int line, int sample);
    double readDouble(int line, int sample);
    int readInt(int line, int sample);
    short readShort(int line, int sample);
    fcomplex readFloatComplex(int line, int sample);
    dcomplex readDoubleComplex(int line, int sample);
    /** @} */

    /** Takes over another file's name and description and opens nothing. This file is closed first. Returns 0. */
    int clone(const BufferFile* source);
    /** Writes raster and side file under another name; 0, 1, 4, 5, 7, 9 as DataFile::copy(). */
    int copy(const char* file_name, int overwrite = 1);

private:
    void readBlock(void* dst, int memory_type, int first_line, int lines, int first_sample, int samples);
    void writeBlock(const void* src, int memory_type, int first_line, int lines, int first_sample, int samples);
    template <typename T>
    T readSample(int type, int line, int sample);
    [[nodiscard]] bool prefixRegion(int first_line, int lines, quo::RasterRegion& region) const;
    [[nodiscard]] int64_t place() const;
    [[nodiscard]] std::string sideFile() const;
    void moveTo(int64_t target);
    void dropBuffer(int64_t next);
    bool loadWindow(int64_t start);
    void note(int status);
    bool flush();
    [[nodiscard]] std::optional<int64_t> end();
    bool hasWindow();
    void markWritten(int64_t first, int64_t last);
    bool advanceForReading();
    int64_t readDirectly(char* to, int64_t n);
    int64_t writeDirectly(const char* src, int64_t n);
    int64_t slideForWriting(const char* src, int64_t n);

    char name_[512] = "";
    std::unique_ptr<quo::AtomicFile> new_raster_;  // from create() on
    std::unique_ptr<quo::RasterStream> stream_;
    std::unique_ptr<char[]> buffer_;
    int mode_ = NOT_OPEN;
    int status_ = 0, error_ = 0;  // of the first failure since open()
    bool loaded_ = false;         // the buffer holds what the file has there; else only the place counts
    int64_t start_ = 0;           // file offset of the buffer's first byte; unbuffered, the current place
    int64_t size_ = 0, keep_ = 0, cursor_ = 0, fill_ = 0;
    int64_t dirty_first_ = 0, dirty_last_ = 0;  // bytes of the buffer that the file does not have yet
};

#endif

#endif
