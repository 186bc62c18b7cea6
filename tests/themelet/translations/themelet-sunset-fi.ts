<?xml version="1.0" encoding="utf-8"?>
<!DOCTYPE TS>
<TS version="2.1" language="fi_FI">
<context>
    <name></name>
    <message>
        <source>themelet-la-sunset</source>
        <translation>Auringonlasku</translation>
    </message>
</context>
</TS>
