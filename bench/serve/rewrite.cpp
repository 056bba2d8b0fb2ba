// How fast the XML library writes a document from data at hand: the yardstick for answers that have to come about.
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include <libxml/xmlreader.h>
#include <libxml/xmlwriter.h>

namespace {

struct Free {
    void operator()(xmlTextReader* reader) const { xmlFreeTextReader(reader); }

    void operator()(xmlTextWriter* writer) const { xmlFreeTextWriter(writer); }

    void operator()(xmlBuffer* buffer) const { xmlBufferFree(buffer); }
};

const xmlChar* chars(const std::string& text) {
    return reinterpret_cast<const xmlChar*>(text.c_str());
}

std::string text(const xmlChar* value) {
    return value == nullptr ? "" : reinterpret_cast<const char*>(value);
}

struct Event {
    int kind = 0; ///< XML_READER_TYPE_ELEMENT, _TEXT or _END_ELEMENT
    std::string text;
    std::vector<std::pair<std::string, std::string>> attributes;
};

std::vector<Event> read(const char* file) {
    const std::unique_ptr<xmlTextReader, Free> reader(xmlReaderForFile(file, nullptr, XML_PARSE_NONET));
    std::vector<Event> events;
    while (reader && xmlTextReaderRead(reader.get()) == 1) {
        const int kind = xmlTextReaderNodeType(reader.get());
        const bool isText = kind == XML_READER_TYPE_TEXT || kind == XML_READER_TYPE_SIGNIFICANT_WHITESPACE;
        const bool isEmpty = xmlTextReaderIsEmptyElement(reader.get()) == 1;
        Event event{isText ? XML_READER_TYPE_TEXT : kind,
                    text(isText ? xmlTextReaderConstValue(reader.get()) : xmlTextReaderConstName(reader.get())),
                    {}};
        while (xmlTextReaderMoveToNextAttribute(reader.get()) == 1) {
            event.attributes.emplace_back(text(xmlTextReaderConstName(reader.get())),
                                          text(xmlTextReaderConstValue(reader.get())));
        }
        events.push_back(std::move(event));
        if (isEmpty) {
            events.push_back({XML_READER_TYPE_END_ELEMENT, "", {}});
        }
    }
    return events;
}

std::size_t write(const std::vector<Event>& events) {
    const std::unique_ptr<xmlBuffer, Free> buffer(xmlBufferCreate());
    const std::unique_ptr<xmlTextWriter, Free> writer(xmlNewTextWriterMemory(buffer.get(), 0));
    xmlTextWriterStartDocument(writer.get(), nullptr, "utf-8", nullptr);
    for (const Event& event : events) {
        if (event.kind == XML_READER_TYPE_ELEMENT) {
            xmlTextWriterStartElement(writer.get(), chars(event.text));
            for (const auto& [name, value] : event.attributes) {
                xmlTextWriterWriteAttribute(writer.get(), chars(name), chars(value));
            }
        } else if (event.kind == XML_READER_TYPE_TEXT) {
            xmlTextWriterWriteString(writer.get(), chars(event.text));
        } else {
            xmlTextWriterFullEndElement(writer.get());
        }
    }
    xmlTextWriterFlush(writer.get());
    return static_cast<std::size_t>(xmlBufferLength(buffer.get()));
}

double cpuSeconds() {
    timespec time{};
    ::clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &time);
    return static_cast<double>(time.tv_sec) + 1e-9 * static_cast<double>(time.tv_nsec);
}

} // namespace

/** Arguments: a document, and seconds. Prints documents a second, microseconds of CPU for each, and its bytes. */
int main(int count, char** arguments) {
    if (count != 3) {
        return EXIT_FAILURE;
    }
    using Clock = std::chrono::steady_clock;
    const std::vector<Event> events = read(arguments[1]);
    const std::chrono::duration<double> wanted(std::atof(arguments[2]));
    const auto start = Clock::now();
    const double cpu = cpuSeconds();
    std::size_t bytes = 0;
    int documents = 0;
    std::chrono::duration<double> taken(0);
    for (; taken < wanted; taken = Clock::now() - start) {
        bytes = write(events);
        ++documents;
    }
    std::printf("%.1f a second %.1f us %zu bytes\n", documents / taken.count(),
                1e6 * (cpuSeconds() - cpu) / documents, bytes);
    return EXIT_SUCCESS;
}
