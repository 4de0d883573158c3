// Shown by docs/serialization.md.
#include <korvane/serialization/KVAsciiStream.h>
#include <korvane/serialization/KVBinaryXMLWriteStream.h>
#include <korvane/serialization/KVBufferWriteStream.h>
#include <korvane/serialization/KVHashWriteStream.h>
#include <korvane/serialization/KVXMLWriteStream.h>

#include <iostream>

enum Token : unsigned int { kShot = 1, kShotName = 1, kShotStart = 2 };
KVScope shotScope[] = {
    {"shot", kShot, 0}, {"name", kShot, kShotName}, {"start", kShot, kShotStart}, {nullptr, 0, 0}};

void describe(KVSerializerWriteStream& out)
{
    out.pushScope(shotScope);
    out.startElement(kShot);
    out.writeAttribute(kShotName, KVString("Harbour"));
    out.writeAttribute(kShotStart, CMTimeMake(96096, 24000));
    out.endElement();
    out.popScope();
    out.close();
}

int main()
{
    KVBufferWriteStream textBytes(4096, 4096), binaryBytes(4096, 4096);
    KVXMLWriteStream text(textBytes, 1, 0);
    KVBinaryXMLWriteStream binary(binaryBytes, 1, 0);
    KVHashWriteStream hash;
    for (KVSerializerWriteStream* form : {static_cast<KVSerializerWriteStream*>(&text),
                                          static_cast<KVSerializerWriteStream*>(&binary),
                                          static_cast<KVSerializerWriteStream*>(&hash)})
        describe(*form);

    KVAsciiStream armour; // the binary form, for where only printable characters pass
    armour.write(binaryBytes.getBuffer(), binaryBytes.getBufferSize());
    armour.close();
    std::cout << textBytes.getBufferSize() << ' ' << binaryBytes.getBufferSize() << ' '
              << armour.getString() << '\n'
              << hash.getHash().getString() << '\n'; // the same whatever the form
    return hash.getHash().getString() == "a6c509293a4256c7f6fbcc2118bb61c4" ? 0 : 1;
}
