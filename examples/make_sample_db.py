#!/usr/bin/env python3
"""Builds the LUD Mox sample database: a small trading company's customers, products,
orders and order lines, and the LUDFile store of product pictures, in one SQLite file.

The data is generated from a fixed seed, so the same arguments always give the same
database. Pictures are real PNG files made here (zlib and struct only): product pictures
go into LUDFile (Filedata, Width, Height); customer logos are written as files next to
the database and their paths stored in Customers.LogoPath.

    python3 examples/make_sample_db.py --output out/sample.db
    python3 examples/make_sample_db.py --output /tmp/bench.db --orders 100000 --no-lines
"""

import argparse
import datetime
import math
import os
import random
import sqlite3
import struct
import sys
import zlib

FIRST_NAMES = ["Anna", "Mart", "Liis", "Jaan", "Kadri", "Peeter", "Maria", "Andris", "Ilze",
               "Janis", "Laura", "Tom", "Emma", "Lukas", "Sofia", "Oliver", "Eva", "Karl"]
COMPANY_WORDS = ["Nord", "Balti", "Lumi", "Kivi", "Meri", "Tamm", "Saar", "Vilnis", "Auseklis",
                 "Ozols", "Linden", "Harbour", "Granite", "Amber", "Falcon", "Northwind",
                 "Riverside", "Summit", "Oak", "Aurora"]
COMPANY_KINDS = ["Trading", "Foods", "Logistics", "Hardware", "Textiles", "Timber", "Dairy",
                 "Electric", "Marine", "Books"]
COMPANY_FORMS = ["AS", "OÜ", "SIA", "Ltd", "GmbH", "Oy"]
CITIES = [("Tallinn", "Estonia"), ("Tartu", "Estonia"), ("Pärnu", "Estonia"),
          ("Riga", "Latvia"), ("Liepāja", "Latvia"), ("Daugavpils", "Latvia"),
          ("Vilnius", "Lithuania"), ("Kaunas", "Lithuania"), ("Helsinki", "Finland"),
          ("Turku", "Finland"), ("Stockholm", "Sweden"), ("Gothenburg", "Sweden"),
          ("Hamburg", "Germany"), ("Berlin", "Germany"), ("Gdańsk", "Poland"),
          ("Oslo", "Norway")]
STREETS = ["Pikk", "Narva mnt", "Brīvības iela", "Gedimino pr.", "Mannerheimintie",
           "Drottninggatan", "Hafenstraße", "Tartu mnt", "Kalnciema iela", "Lai"]
PRODUCT_WORDS = [("Oak", "table"), ("Pine", "shelf"), ("Linen", "towel"), ("Wool", "blanket"),
                 ("Steel", "kettle"), ("Ceramic", "mug"), ("Amber", "pendant"),
                 ("Birch", "chair"), ("Copper", "lamp"), ("Glass", "vase"),
                 ("Leather", "bag"), ("Cotton", "shirt"), ("Rye", "bread box"),
                 ("Granite", "mortar"), ("Willow", "basket"), ("Juniper", "board")]
STATUSES = ["Shipped", "Shipped", "Shipped", "Invoiced", "Open", "Cancelled"]
SALESPEOPLE = ["A. Tamm", "K. Saar", "J. Ozols", "L. Kalniņa", "M. Berg", "E. Virtanen"]


def png(width, height, pixel):
    """A PNG file (8-bit RGB) whose pixels come from pixel(x, y) -> (r, g, b)."""
    rows = bytearray()
    for y in range(height):
        rows.append(0)  # filter: none
        for x in range(width):
            rows.extend(pixel(x, y))

    def chunk(kind, data):
        body = kind + data
        return struct.pack(">I", len(data)) + body + struct.pack(">I", zlib.crc32(body) & 0xFFFFFFFF)

    header = struct.pack(">IIBBBBB", width, height, 8, 2, 0, 0, 0)
    return (b"\x89PNG\r\n\x1a\n" + chunk(b"IHDR", header)
            + chunk(b"IDAT", zlib.compress(bytes(rows), 9)) + chunk(b"IEND", b""))


def product_picture(rng):
    """A product shot of sorts: a shaded disc or box on a light background."""
    width, height = rng.choice([(96, 64), (64, 64), (64, 96), (120, 60), (80, 48)])
    base = (rng.randrange(40, 200), rng.randrange(40, 200), rng.randrange(40, 200))
    disc = rng.random() < 0.5
    cx, cy = width / 2, height / 2
    radius = min(width, height) * 0.38

    def pixel(x, y):
        if disc:
            d = math.hypot(x - cx, y - cy) / radius
            inside = d <= 1.0
            shade = 1.0 - 0.5 * d
        else:
            inside = abs(x - cx) < width * 0.32 and abs(y - cy) < height * 0.3
            shade = 0.7 + 0.3 * (1 - y / height)
        if not inside:
            return (245, 244, 240)
        return tuple(max(0, min(255, int(c * shade + 40))) for c in base)

    return width, height, png(width, height, pixel)


def logo_picture(index):
    """A customer's logo: diagonal bands in the customer's colours."""
    width, height = 160, 64
    rng = random.Random(1000 + index)
    colours = [(rng.randrange(0, 120), rng.randrange(60, 200), rng.randrange(100, 255)),
               (rng.randrange(150, 255), rng.randrange(100, 220), rng.randrange(0, 90))]

    def pixel(x, y):
        band = ((x + 2 * y) // 24) % 3
        if band == 2:
            return (255, 255, 255)
        return colours[band]

    return png(width, height, pixel)


def build(path, orders, lines, customers, products, pictures_dir):
    rng = random.Random(20261206)
    if os.path.exists(path):
        os.remove(path)
    db = sqlite3.connect(path)
    db.executescript("""
        PRAGMA journal_mode = OFF;
        PRAGMA synchronous = OFF;
        CREATE TABLE Customers (
            CustomerID INTEGER PRIMARY KEY, Name TEXT NOT NULL, Contact TEXT, Street TEXT,
            City TEXT, Country TEXT, Phone TEXT, LogoPath TEXT, CreditLimit NUMERIC);
        CREATE TABLE LUDFile (
            FileID INTEGER PRIMARY KEY, Filename TEXT, Filedata BLOB, Width INTEGER,
            Height INTEGER);
        CREATE TABLE Products (
            ProductID INTEGER PRIMARY KEY, Name TEXT NOT NULL, UnitPrice NUMERIC,
            FileID INTEGER REFERENCES LUDFile (FileID));
        CREATE TABLE Orders (
            OrderID INTEGER PRIMARY KEY, CustomerID INTEGER REFERENCES Customers (CustomerID),
            OrderDate TEXT, ShipDate TEXT, Status TEXT, ShipCity TEXT, ShipCountry TEXT,
            Salesperson TEXT, Items INTEGER, Amount NUMERIC, Freight NUMERIC);
        CREATE TABLE OrderLines (
            LineID INTEGER PRIMARY KEY, OrderID INTEGER REFERENCES Orders (OrderID),
            LineNo INTEGER, ProductID INTEGER REFERENCES Products (ProductID),
            Quantity INTEGER, UnitPrice NUMERIC, Discount REAL, LineTotal NUMERIC);
    """)

    if pictures_dir:
        os.makedirs(pictures_dir, exist_ok=True)
    customer_rows = []
    for c in range(1, customers + 1):
        name = "%s %s %s" % (rng.choice(COMPANY_WORDS), rng.choice(COMPANY_KINDS),
                             rng.choice(COMPANY_FORMS))
        city, country = rng.choice(CITIES)
        logo = None
        if pictures_dir and c % 4 != 0:  # every fourth customer has no logo
            logo = os.path.abspath(os.path.join(pictures_dir, "logo-%04d.png" % c))
            with open(logo, "wb") as f:
                f.write(logo_picture(c))
        customer_rows.append((c, name, "%s %s" % (rng.choice(FIRST_NAMES), rng.choice(
            ["Tamm", "Saar", "Ozols", "Berg", "Kask", "Liepa", "Virtanen"])),
            "%s %d" % (rng.choice(STREETS), rng.randrange(1, 120)), city, country,
            "+%d %d" % (rng.choice([372, 371, 370, 358, 46, 49]), rng.randrange(5000000, 9999999)),
            logo, rng.choice([5000, 10000, 25000, 50000])))
    db.executemany("INSERT INTO Customers VALUES (?,?,?,?,?,?,?,?,?)", customer_rows)

    product_rows = []
    for p in range(1, products + 1):
        material, thing = PRODUCT_WORDS[(p - 1) % len(PRODUCT_WORDS)]
        file_id = None
        if p % 5 != 0:  # some products have no picture
            width, height, data = product_picture(rng)
            db.execute("INSERT INTO LUDFile VALUES (?,?,?,?,?)",
                       (p, "product-%03d.png" % p, data, width, height))
            file_id = p
        product_rows.append((p, "%s %s %d" % (material, thing, p), round(rng.uniform(3, 400), 2),
                             file_id))
    db.executemany("INSERT INTO Products VALUES (?,?,?,?)", product_rows)

    start = datetime.date(2025, 1, 1)
    order_rows = []
    line_rows = []
    line_id = 0
    for o in range(1, orders + 1):
        customer = customer_rows[int(customers * rng.random() ** 1.6) % customers]
        day = start + datetime.timedelta(days=(o * 700) // max(orders, 1) + rng.randrange(0, 3))
        status = rng.choice(STATUSES)
        ship = (day + datetime.timedelta(days=rng.randrange(1, 9))).isoformat() \
            if status in ("Shipped", "Invoiced") else None
        count = rng.randrange(1, 7)
        amount = 0.0
        items = 0
        for n in range(1, count + 1):
            product = rng.choice(product_rows)
            quantity = rng.randrange(1, 25)
            discount = rng.choice([0, 0, 0, 0.05, 0.1])
            total = round(quantity * product[2] * (1 - discount), 2)
            amount += total
            items += quantity
            if lines:
                line_id += 1
                line_rows.append((line_id, o, n, product[0], quantity, product[2], discount, total))
        order_rows.append((o, customer[0], day.isoformat(), ship, status, customer[4], customer[5],
                           rng.choice(SALESPEOPLE), items, round(amount, 2),
                           round(rng.uniform(5, 80), 2)))
        if len(order_rows) >= 50000:
            db.executemany("INSERT INTO Orders VALUES (?,?,?,?,?,?,?,?,?,?,?)", order_rows)
            order_rows.clear()
        if len(line_rows) >= 50000:
            db.executemany("INSERT INTO OrderLines VALUES (?,?,?,?,?,?,?,?)", line_rows)
            line_rows.clear()
    db.executemany("INSERT INTO Orders VALUES (?,?,?,?,?,?,?,?,?,?,?)", order_rows)
    db.executemany("INSERT INTO OrderLines VALUES (?,?,?,?,?,?,?,?)", line_rows)
    db.executescript("""
        CREATE INDEX OrdersCustomer ON Orders (CustomerID);
        CREATE INDEX LinesOrder ON OrderLines (OrderID);
    """)
    db.commit()
    db.close()


def main():
    parser = argparse.ArgumentParser(description=__doc__.split("\n\n")[0])
    parser.add_argument("--output", required=True, help="the database file to (re)create")
    parser.add_argument("--orders", type=int, default=3000)
    parser.add_argument("--customers", type=int, default=200)
    parser.add_argument("--products", type=int, default=60)
    parser.add_argument("--no-lines", action="store_true", help="leave OrderLines empty")
    parser.add_argument("--pictures", help="folder for the customer logos "
                        "(default: 'pictures' next to the database)")
    args = parser.parse_args()
    if args.orders < 0 or args.customers < 1 or args.products < 1:
        parser.error("orders must not be negative; customers and products at least 1")
    folder = os.path.dirname(os.path.abspath(args.output))
    os.makedirs(folder, exist_ok=True)
    pictures = args.pictures or os.path.join(folder, "pictures")
    build(args.output, args.orders, not args.no_lines, args.customers, args.products, pictures)
    return 0


if __name__ == "__main__":
    sys.exit(main())
